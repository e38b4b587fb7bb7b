// Shapes of the scalar core and its ports (frame/shapes.h tells how shapes are written).
#ifndef KASTARRI_FRAME_SCALAR_SHAPES_H
#define KASTARRI_FRAME_SCALAR_SHAPES_H

// Scalar registers are plain integers, so a row holds its whole rule: result type, parameters, expression.
#define SIG_scalar(SYMBOL, R, PARAMETERS, ...) R SYMBOL PARAMETERS
#define BODY_scalar(R, PARAMETERS, ...) return __VA_ARGS__;

#endif
