// Loads and stores of whole vectors.
#include "memory/kernels.h"

#include "memory/stamp.h"

#include "memory/vectors.def"

#include "frame/stamp_end.h"
