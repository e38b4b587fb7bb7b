// Bitwise logic on vectors and scalars.
#include "integer/bits.h"

#include "integer/kernels.h"

#include "frame/stamp.h"

#include "integer/logic.def"

#include "frame/stamp_end.h"
