// Floating-point arithmetic on vectors and single lanes.
#include "float/vectors.h"

#include "float/stamp.h"

#include "float/kernels.h"

#include "float/arithmetic.def"

#include "frame/stamp_end.h"
