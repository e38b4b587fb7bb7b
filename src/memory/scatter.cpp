// Scatters.
#include "memory/gather.h"

namespace {

// What enables the upper half of the lanes.
inline Same<bool> upper(Same<bool> all) { return all; }
inline const word* upper(const word* predicate) { return predicate + 1; }

}  // namespace

#include "frame/stamp.h"

// The layout of the offsets, what is written of an element, the layout of the data.
#define KERNEL_scatter(OP, O, WRITTEN, D)                                                                         \
  template <class Units, class Offsets, class Enabled, class Memory>                                              \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* v, const Offsets* offsets, Enabled enabled, Memory* base) { \
    const Read<D> data(v);                                                                                        \
    scatter<O::container, WRITTEN>(ElementAddresses<O>(base, Read<O>(offsets), enabled),                          \
                                   [&](O::container, int i) { return data[i]; });                                 \
  }
#define KERNEL_scatter_high(OP, O, WRITTEN, D)                                                                    \
  KERNEL_scatter(OP##_of, O, WRITTEN, D)                                                                          \
  template <class Enabled, class Memory>                                                                          \
  static inline void KASTARRI_SEMANTIC(OP)(const word* v, const word* offsets, Enabled enabled, Memory* base) {   \
    KASTARRI_SEMANTIC(OP##_of)(v + 8, offsets, upper(enabled), base);                                             \
  }

#define KERNEL_increment(OP, O)                                                                   \
  template <class Units, class Memory>                                                            \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* offsets, Memory* base) {                  \
    scatter<O::container, O::container>(ElementAddresses<O>(base, Read<O>(offsets), Same(true)),  \
                                        [](O::container old, int) { return old + 1u; });           \
  }

#include "memory/scatter.def"

#include "frame/stamp_end.h"
