// Sums of the lanes of a vector.
#include "frame/arithmetic.h"
#include "frame/lanes.h"

namespace {

// What a sum is formed in: twice the width of its lanes holds it (64 lanes of 8 bits, 32 of 16). Of 32-bit lanes only
// the low 32 bits are returned.
template <class L>
using sum_of = std::conditional_t<L::bits == 8, std::uint16_t, std::uint32_t>;

template <class L, class Units>
inline sum_of<L> sum(const Units* a) {
  const Read<L> lane(a);
  sum_of<L> total = 0;
  for (int i = 0; i < L::count; ++i) total = static_cast<sum_of<L>>(total + static_cast<sum_of<L>>(lane[i]));
  return total;
}

template <class L, class Units, class PredicateUnit>
inline sum_of<L> sum(const Units* a, const PredicateUnit* p) {
  LaneMask<L::bits, L::count> enabled;
  enabled.expand(p);
  typename L::container kept[L::count];
  const Read<L> lane(a);
  KASTARRI_LANES_INDEPENDENT
  for (int i = 0; i < L::count; ++i)
    kept[i] = static_cast<typename L::container>(unsigned_bits(lane[i]) & enabled.lane[i]);
  return sum<L>(kept);
}

constexpr auto EXACT = [](auto total) { return total; };
constexpr auto CLAMPED = [](auto total) { return saturate<std::int16_t>(static_cast<std::int32_t>(total)); };

}  // namespace

#include "integer/stamp.h"

// The sum of all lanes, or of the enabled ones: result layout, what becomes of the sum, layout of a lane.
#define KERNEL_sum(OP, R, RULE, L)                                                            \
  template <class Units, class Unit>                                                          \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Unit* r) {                         \
    Write<R>(r).put(0, RULE(sum<L>(a)));                                                      \
  }                                                                                           \
  template <class Units, class PredicateUnit, class Unit>                                     \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, const PredicateUnit* p, Unit* r) { \
    Write<R>(r).put(0, RULE(sum<L>(a, p)));                                                   \
  }

#include "integer/reductions.def"

#include "frame/stamp_end.h"
