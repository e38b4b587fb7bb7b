// Loads that widen lanes and stores that narrow them.
#include "memory/kernels.h"

#include "frame/stamp.h"

#include "memory/widening.def"

#include "frame/stamp_end.h"
