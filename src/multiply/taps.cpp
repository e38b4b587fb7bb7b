// Vectors times coefficients: one, two or four products a lane.
#include "multiply/taps.h"

#include "multiply/stamp.h"

// KERNEL(OP, kind_taps, result layout, number of operands, their layout, coefficients)
#define KERNEL_TAPS(OP, KIND, R, N, L, C) \
  KERNEL_OF_WORDS(OP, (Taps<R, L, C, std::make_index_sequence<N>>::KIND(units...)))
#define KERNEL_fresh_taps(OP, ...) KERNEL_TAPS(OP, fresh, __VA_ARGS__)
#define KERNEL_add_taps(OP, ...) KERNEL_TAPS(OP, add, __VA_ARGS__)

#include "multiply/taps.def"

#include "frame/stamp_end.h"
