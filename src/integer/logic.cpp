// Bitwise logic on vectors and scalars.
#include "integer/bits.h"

#include "integer/kernels.h"

#include "integer/stamp.h"

#include "integer/logic.def"

#include "frame/stamp_end.h"
