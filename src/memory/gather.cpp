// Gathers.
#include "memory/gather.h"
#include "memory/kernels.h"

#include "memory/stamp.h"

// The layout of offsets and gathered units, and the bits of an element, which are the low ones of a unit.
#define KERNEL_gather(OP, O, BITS)                                                            \
  template <class Memory, class Units, class... Predicate>                                    \
  static inline void KASTARRI_SEMANTIC(OP)(const Memory* base, const Units* offsets, word* r, \
                                           const Predicate*... predicate) {                   \
    word nowhere = 0;                                                                         \
    base = anywhere(base);                                                                    \
    gather<O, BITS>(base, offsets, elements(base, nowhere, *predicate...), r);                \
  }

// The units of the gather register as lanes of the result, or their low bytes as its low or high half.
#define KERNEL_gathered(OP, R)                                              \
  static inline void KASTARRI_SEMANTIC(OP)(const word* gathered, word* r) { \
    lanes<R::count>(Write<R>(r), SAME, GatherRegister(gathered).units());   \
  }
#define KERNEL_gathered_low(OP, R)                                                                        \
  KERNEL_gathered(OP##_half, R) static inline void KASTARRI_SEMANTIC(OP)(const word* gathered, word* r) { \
    KASTARRI_SEMANTIC(OP##_half)(gathered, r);                                                            \
    lanes<32>(Write<u8x32>(r + 8), SAME, Same(0));                                                        \
  }
#define KERNEL_gathered_high(OP, R)                                                                       \
  KERNEL_gathered(OP##_half, R) static inline void KASTARRI_SEMANTIC(OP)(const word* gathered, word* r) { \
    KASTARRI_SEMANTIC(OP##_half)(gathered, r + 8);                                                        \
  }

#include "memory/gather.def"

#include "frame/stamp_end.h"
