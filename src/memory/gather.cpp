// Gathers.
#include "memory/gather.h"
#include "memory/kernels.h"

#include "frame/stamp.h"

// The layout of the offsets, which is that of the elements too.
#define KERNEL_gather(OP, O)                                                                                     \
  template <class Memory, class Units, class Enabled>                                                            \
  static inline void KASTARRI_SEMANTIC(OP)(const Memory* base, const Units* offsets, Enabled enabled, word* r) { \
    gather(ElementAddresses<O>(base, Read<O>(offsets), enabled), r);                                             \
  }

// Elements of 8 bits are the low bytes of 16-bit ones.
#define KERNEL_gather_bytes(OP)                                                                                  \
  template <class Memory, class Units, class Enabled>                                                            \
  static inline void KASTARRI_SEMANTIC(OP)(const Memory* base, const Units* offsets, Enabled enabled, word* r) { \
    gather(ElementAddresses<u16x32>(base, Read<u16x32>(offsets), enabled), r);                                   \
    lanes<32>(Write<u16x32>(r), [](word unit) { return unit & 0xFF; }, Read<u16x32>(r));                         \
  }

#define KERNEL_gathered_low(OP)                                           \
  static inline void KASTARRI_SEMANTIC(OP)(const word* gathered, word* r) { \
    lanes<32>(Write<u8x32>(r), SAME, Read<u16x32>(gathered));             \
    lanes<32>(Write<u8x32>(r + 8), SAME, Same(0));                        \
  }

#define KERNEL_gathered_high(OP)                                          \
  static inline void KASTARRI_SEMANTIC(OP)(const word* gathered, word* r) { \
    lanes<32>(Write<u8x32>(r + 8), SAME, Read<u16x32>(gathered));         \
  }

#include "memory/gather.def"

#include "frame/stamp_end.h"
