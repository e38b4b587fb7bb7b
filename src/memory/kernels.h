// Forms of semantic functions that several sources of the memory family stamp (frame/stamp.h).
#ifndef KASTARRI_MEMORY_KERNELS_H
#define KASTARRI_MEMORY_KERNELS_H

#include "frame/arithmetic.h"
#include "frame/registers.h"
#include "memory/merge.h"

namespace {

constexpr auto SATURATE8 = [](std::int16_t lane) { return saturate<std::int8_t>(lane); };
// A lane fits if its upper 17 bits are alike: one comparison, where SSE2 has no 32-bit minimum and maximum.
constexpr auto SATURATE16 = [](std::int32_t lane) {
  const std::int32_t sign = sign_fill(lane);
  return static_cast<std::int16_t>((lane >> 15) == sign ? lane : sign ^ 0x7FFF);
};

// A register from memory, its lanes, of layout L, 0 where they are not enabled. All is loaded before any is stored:
// memory may lie in part of the register.
template <class L, class Unit, class PredicateUnit>
inline void load_where(const void* from, UnitsUnder<Unit, PredicateUnit, true> r) {
  constexpr int registers = 64 / register_bytes;
  LaneMask<L::bits, L::count> enabled;
  enabled.expand(r.predicate);
  Words all[registers];
  for (int k = 0; k < registers; ++k) all[k] = load_register<word>(from, k) & load_register<word>(enabled.lane, k);
  for (int k = 0; k < registers; ++k) store_register(r.units, k, all[k]);
}

}  // namespace

// A whole register as it is; under a predicate lanes of layout L.
#define KERNEL_copy(OP, L)                                          \
  template <class Units, class Out>                                 \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Out r) { \
    if constexpr (std::is_pointer_v<Out>)                           \
      copy_registers<64>(a, r);                                     \
    else                                                            \
      load_where<L>(a, r);                                          \
  }

// Lanes of a vector cut to narrower ones.
#define KERNEL_cut(OP, R, A)                                             \
  template <class Units, class Memory>                                   \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* v, Memory* to) { \
    lanes<R::count>(Write<R>(to), SAME, ReadWhole<A>(v));                \
  }

// A predicated store: layout in memory, rule, layout in the register.
#define KERNEL_store_where(OP, M, RULE, A)                                                       \
  template <class Units, class PredicateUnit, class Memory>                                      \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* v, const PredicateUnit* p, Memory* to) { \
    store_where<M, A>(v, RULE, p, to);                                                           \
  }

#endif
