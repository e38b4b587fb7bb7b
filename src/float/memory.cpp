// Loads and stores that convert between singles in the register and halves in memory.
#include "float/convert.h"
#include "float/vectors.h"
#include "memory/merge.h"

namespace {

// Memory is loaded before a lane of the register is stored, which may lie in part of it, and the other way round.
template <class Memory, class Unit>
inline void load_halves(const Memory* from, Unit* r) {
  alignas(64) std::uint16_t halves[16];
  std::memcpy(halves, from, sizeof halves);
  convert_register<f16x16, f32x16>(r, halves, 0);
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
#define KERNEL_store_halves(OP, SINGLES, HALVES)                         \
  template <class Units, class Memory>                                   \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* v, Memory* to) { \
    alignas(64) Units all[64 / sizeof(Units)];                           \
    copy_registers<64>(v, all);                                          \
    convert_register<SINGLES, HALVES>(to, all, 0);                       \
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
