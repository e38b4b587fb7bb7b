// Shapes that only integer vectors have (frame/shapes.h tells how shapes are written).
#ifndef KASTARRI_INTEGER_SHAPES_H
#define KASTARRI_INTEGER_SHAPES_H

#endif
