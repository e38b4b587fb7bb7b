// The lanes of a vector to one value: their sum, the largest, what they have in common.
#include "frame/arithmetic.h"
#include "frame/lanes.h"

namespace {

// What a sum is formed in: twice the width of its lanes holds it (64 lanes of 8 bits, 32 of 16). Of 32-bit lanes only
// the low 32 bits are returned.
template <class L>
using sum_of = std::conditional_t<L::bits == 8, std::uint16_t, std::uint32_t>;

// The lanes whose predicate bit is 1; in place of the others a value that changes no result, the identity.
template <class L>
struct Enabled {
  using Lane = typename L::container;
  Lane lane[L::count];

  template <class Units, class PredicateUnit>
  Enabled(const Units* a, const PredicateUnit* p, Lane identity) {
    LaneMask<L::bits, L::count> enabled;
    enabled.expand(p);
    const Read<L> all(a);
    const auto neutral = unsigned_bits(identity);
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < L::count; ++i)
      lane[i] = static_cast<Lane>(((unsigned_bits(all[i]) ^ neutral) & enabled.lane[i]) ^ neutral);
  }
};

template <class L, class Units>
inline sum_of<L> sum(const Units* a) {
  const Read<L> lane(a);
  sum_of<L> total = 0;
  for (int i = 0; i < L::count; ++i) total = static_cast<sum_of<L>>(total + static_cast<sum_of<L>>(lane[i]));
  return total;
}

template <class L, class Units, class PredicateUnit>
inline sum_of<L> sum(const Units* a, const PredicateUnit* p) {
  const Enabled<L> kept(a, p, 0);
  return sum<L>(kept.lane);
}

// An operation that combines lanes one after the other, and its identity: what changes no lane.
template <class Rule, class Identity>
struct Combination {
  Rule rule;
  Identity identity;
};
template <class Rule, class Identity>
Combination(Rule, Identity) -> Combination<Rule, Identity>;

constexpr auto lowest = [](auto lane) { return std::numeric_limits<decltype(lane)>::min(); };
constexpr auto highest = [](auto lane) { return std::numeric_limits<decltype(lane)>::max(); };
constexpr auto zeros = [](auto) { return 0; };
constexpr auto ones = [](auto) { return -1; };

constexpr Combination MAX{[](auto x, auto y) { return x > y ? x : y; }, lowest};
constexpr Combination MIN{[](auto x, auto y) { return x < y ? x : y; }, highest};
constexpr Combination XOR{[](auto x, auto y) { return x ^ y; }, zeros};
constexpr Combination OR{[](auto x, auto y) { return x | y; }, zeros};
constexpr Combination AND{[](auto x, auto y) { return x & y; }, ones};

// `first` and all lanes.
template <class L, class Operation, class Units, class Lane = typename L::container>
inline Lane combined(const Operation& operation, Lane first, const Units* a) {
  const Read<L> lane(a);
  for (int i = 0; i < L::count; ++i) first = static_cast<Lane>(operation.rule(first, lane[i]));
  return first;
}

template <class L, class Operation>
constexpr auto identity_of(const Operation& operation) {
  using Lane = typename L::container;
  return static_cast<Lane>(operation.identity(Lane{}));
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

// All lanes combined, or the enabled ones; with the accumulator: operation, layout of the lanes and of the result.
#define KERNEL_combined(OP, OPERATION, L)                                                     \
  template <class Units, class Unit>                                                          \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Unit* r) {                         \
    Write<L>(r).put(0, combined<L>(OPERATION, identity_of<L>(OPERATION), a));                 \
  }                                                                                           \
  template <class Units, class PredicateUnit, class Unit>                                     \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, const PredicateUnit* p, Unit* r) { \
    const auto identity = identity_of<L>(OPERATION);                                          \
    const Enabled<L> kept(a, p, identity);                                                    \
    Write<L>(r).put(0, combined<L>(OPERATION, identity, kept.lane));                          \
  }
#define KERNEL_combined_with(OP, OPERATION, L)                                         \
  template <class Units, class Unit>                                                   \
  static inline void KASTARRI_SEMANTIC(OP)(const Unit* acc, const Units* a, Unit* r) { \
    const auto others = combined<L>(OPERATION, identity_of<L>(OPERATION), a);          \
    Write<L>(r).put(0, OPERATION.rule(Read<L>(acc)[0], others));                       \
  }

#include "integer/reductions.def"

#include "frame/stamp_end.h"
