// Scatters.
#include "memory/gather.h"

#include "memory/stamp.h"

// The layout of the offsets, the element, the layout of the data, the first lane of the data.
#define KERNEL_scatter_from(OP, O, ELEMENT, D, FIRST)                                            \
  template <class Units, class Offsets, class Memory, class... Predicate>                        \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* v, const Offsets* offsets, Memory* base, \
                                           const Predicate*... predicate) {                      \
    word nowhere = 0;                                                                            \
    base = anywhere(base);                                                                       \
    scatter<ELEMENT, O, D>(base, offsets, elements(base, nowhere, predicate[FIRST / 32]...),     \
                           v + FIRST * D::bits / 32);                                            \
  }
#define KERNEL_scatter(OP, O, ELEMENT, D) KERNEL_scatter_from(OP, O, ELEMENT, D, 0)
#define KERNEL_scatter_high(OP, O, ELEMENT, D) KERNEL_scatter_from(OP, O, ELEMENT, D, 32)

#define KERNEL_increment(OP, O)                                                  \
  template <class Units, class Memory>                                           \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* offsets, Memory* base) { \
    increment<O>(base, offsets);                                                 \
  }

#include "memory/scatter.def"

#include "frame/stamp_end.h"
