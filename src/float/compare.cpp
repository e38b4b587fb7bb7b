// Floating-point comparisons of vectors and single lanes.
#include "float/vectors.h"

#include "float/stamp.h"

#include "float/kernels.h"

#include "float/compare.def"

#include "frame/stamp_end.h"
