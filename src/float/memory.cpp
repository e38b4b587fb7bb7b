// Loads and stores that convert between singles in the register and halves in memory.
#include "float/convert.h"
#include "float/vectors.h"
#include "memory/merge.h"

namespace {

constexpr auto SAME = [](auto lane) { return lane; };

template <class Memory, class Unit>
inline void load_halves(const Memory* from, Unit* r) {
  convert_register<f16x16, f32x16>(r, from, 0);
}

// A lane that is not enabled is read as a zero half: no flag, and 0 in the register.
template <class Memory, class Unit, class PredicateUnit>
inline void load_halves(const Memory* from, UnitsUnder<Unit, PredicateUnit, true> r) {
  alignas(64) std::uint16_t halves[16];
  lanes<16>(result<f16x16>(clear(halves, r.predicate)), SAME, Read<f16x16>(from));
  convert_register<f16x16, f32x16>(r.units, halves, 0);
}

}  // namespace

#include "float/stamp.h"

#include "float/kernels.h"

#define KERNEL_load_halves(OP, UNUSED)                                  \
  template <class Memory, class Out>                                    \
  static inline void KASTARRI_SEMANTIC(OP)(const Memory* from, Out r) { \
    load_halves(from, r);                                               \
  }
#define KERNEL_store_halves_where(OP, SINGLES, HALVES)                                           \
  template <class Units, class PredicateUnit, class Memory>                                      \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* v, const PredicateUnit* p, Memory* to) { \
    alignas(64) typename SINGLES::container enabled[SINGLES::count];                             \
    alignas(64) typename HALVES::container halves[HALVES::count];                                \
    lanes<SINGLES::count>(result<SINGLES>(clear(enabled, p)), SAME, Read<SINGLES>(v));           \
    convert_register<SINGLES, HALVES>(halves, enabled, 0);                                       \
    store_where<HALVES, HALVES>(halves, SAME, p, to);                                            \
  }

#include "float/memory.def"

#include "frame/stamp_end.h"
