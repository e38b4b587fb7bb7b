// The shape and the kind of row of the scalar core and its ports (frame/shapes.h tells how shapes are written).
#ifndef KASTARRI_SCALAR_SHAPES_H
#define KASTARRI_SCALAR_SHAPES_H

#define SCALAR(PACKAGE, NAME, ...) ENTRY(rk_##PACKAGE##_##NAME, scalar, __VA_ARGS__)

// Scalar registers are plain integers, so a row holds its whole rule: result type, parameters, expression.
#define SIG_scalar(SYMBOL, R, PARAMETERS, ...) R SYMBOL PARAMETERS
#define BODY_scalar(R, PARAMETERS, ...) return __VA_ARGS__;

#endif
