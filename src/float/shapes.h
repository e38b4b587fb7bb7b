// Shapes of floating-point operations (frame/shapes.h tells how shapes are written).
#ifndef KASTARRI_FLOAT_SHAPES_H
#define KASTARRI_FLOAT_SHAPES_H

#endif
