// Predicates: logic, reductions, the first lanes.
#include "frame/lanes.h"
#include "integer/bits.h"
#include "integer/kernels.h"

namespace {

// The first n of a predicate's bits, which are `count`.
struct MODULO {
  static constexpr int bits(int n, int count) {
    return static_cast<int>(static_cast<word>(n) % static_cast<word>(count));
  }
};
struct CLAMPED {
  static constexpr int bits(int n, int count) { return n < 0 ? 0 : n > count ? count : n; }
};

// A predicate has at most two words; x and y are the first and the last.
constexpr auto ALL = [](auto x, auto y) { return static_cast<decltype(x)>(~(x & y)) == 0; };
constexpr auto ANY = [](auto x, auto y) { return (x | y) != 0; };

}  // namespace

#include "integer/stamp.h"

#define KERNEL_whole(OP, RULE, L)                                   \
  template <class Unit, class Bit>                                  \
  static inline void KASTARRI_SEMANTIC(OP)(const Unit* p, Bit* r) { \
    *r = RULE(p[0], p[L::count - 1]) ? 1 : 0;                       \
  }
#define KERNEL_first(OP, RULE, P)                                                                               \
  template <class Unit>                                                                                         \
  static inline void KASTARRI_SEMANTIC(OP)(int n, Unit* r) {                                                    \
    const int ones = RULE::bits(n, P::count);                                                                   \
    const std::uint64_t bits = ones == 0 ? 0 : ~std::uint64_t{0} >> (64 - ones);                                \
    for (int i = 0; i < P::count; i += 8 * static_cast<int>(sizeof(Unit))) *r++ = static_cast<Unit>(bits >> i); \
  }

#include "integer/predicates.def"

#include "frame/stamp_end.h"
