// Vectors times coefficients: one, two or four products a lane.
#include "multiply/taps.h"

#include "multiply/stamp.h"

// KERNEL(OP, taps, kind, result layout, number of operands, their layout, coefficients)
#define KERNEL_taps(OP, KIND, R, N, L, C) \
  KERNEL_OF_KIND(OP, KIND, Taps<R, KIND, L, C, std::make_index_sequence<N>>::run)

#include "multiply/taps.def"

#include "frame/stamp_end.h"
