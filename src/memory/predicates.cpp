// Loads and stores of predicates.
#include "memory/kernels.h"

#include "memory/stamp.h"

#include "memory/predicates.def"

#include "frame/stamp_end.h"
