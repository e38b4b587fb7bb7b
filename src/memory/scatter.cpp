// Scatters.
#include "memory/gather.h"

namespace {

// What enables the upper half of the lanes.
inline Same<bool> upper(Same<bool> all) { return all; }
inline const word* upper(const word* predicate) { return predicate + 1; }

}  // namespace

#include "frame/stamp.h"

// The layout of the offsets, the element, the layout of the data.
#define KERNEL_scatter(OP, O, ELEMENT, D)                                                                           \
  template <class Units, class Offsets, class Enabled, class Memory>                                                \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* v, const Offsets* offsets, Enabled enabled, Memory* base) { \
    const Read<D> data(v);                                                                                          \
    scatter<ELEMENT>(ElementAddresses<O>(base, Read<O>(offsets), enabled), [&](int i) { return data[i]; });         \
  }
#define KERNEL_scatter_high(OP, O, ELEMENT, D)                                                                  \
  KERNEL_scatter(OP##_of, O, ELEMENT, D) template <class Enabled, class Memory>                                 \
  static inline void KASTARRI_SEMANTIC(OP)(const word* v, const word* offsets, Enabled enabled, Memory* base) { \
    KASTARRI_SEMANTIC(OP##_of)(v + 8, offsets, upper(enabled), base);                                           \
  }

#define KERNEL_increment(OP, O)                                                   \
  template <class Units, class Memory>                                            \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* offsets, Memory* base) {  \
    modify<O::container>(ElementAddresses<O>(base, Read<O>(offsets), Same(true)), \
                         [](O::container old, int) { return old + 1u; });         \
  }

#include "memory/scatter.def"

#include "frame/stamp_end.h"
