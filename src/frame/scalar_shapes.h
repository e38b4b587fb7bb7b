// Shapes of the scalar core and its ports (frame/shapes.h tells how shapes are written).
#ifndef KASTARRI_FRAME_SCALAR_SHAPES_H
#define KASTARRI_FRAME_SCALAR_SHAPES_H

#endif
