// Gathers.
#include "memory/gather.h"
#include "memory/kernels.h"

#include "frame/stamp.h"

// The layout of offsets and gathered units, and the bits of an element, which are the low ones of a unit.
#define KERNEL_gather(OP, O, BITS)                                                                               \
  template <class Memory, class Units, class Enabled>                                                            \
  static inline void KASTARRI_SEMANTIC(OP)(const Memory* base, const Units* offsets, Enabled enabled, word* r) { \
    gather(ElementAddresses<O>(base, Read<O>(offsets), enabled), r);                                             \
    using Element = Layout<O::container, BITS, O::count>;                                                        \
    if (BITS < O::bits) lanes<O::count>(Write<O>(r), SAME, Read<Element>(r));                                    \
  }

// The low bytes of the units as the low or high half of the result.
#define KERNEL_gathered_low(OP, UNITS)                                      \
  static inline void KASTARRI_SEMANTIC(OP)(const word* gathered, word* r) { \
    lanes<32>(Write<u8x32>(r), SAME, Read<UNITS>(gathered));                \
    lanes<32>(Write<u8x32>(r + 8), SAME, Same(0));                          \
  }
#define KERNEL_gathered_high(OP, UNITS)                                     \
  static inline void KASTARRI_SEMANTIC(OP)(const word* gathered, word* r) { \
    lanes<32>(Write<u8x32>(r + 8), SAME, Read<UNITS>(gathered));            \
  }

#include "memory/gather.def"

#include "frame/stamp_end.h"
