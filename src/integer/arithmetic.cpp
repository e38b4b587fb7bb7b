// Addition, subtraction, negation, absolute values.
#include "frame/arithmetic.h"

#include "integer/kernels.h"

namespace {

// Rules. x and y are lanes of one type; what a rule returns is cut to the lane.

constexpr auto ADD = [](auto x, auto y) { return unsigned_bits(x) + unsigned_bits(y); };
constexpr auto SUB = [](auto x, auto y) { return unsigned_bits(x) - unsigned_bits(y); };
constexpr auto NEG = [](auto x) { return 0u - unsigned_bits(x); };

// The end of the range on the side of x. Of 16 bits: 0x7FFF for x >= 0, else 0x8000, which is 0xFFFF ^ 0x7FFF.
constexpr auto bound_of = [](auto x) {
  using T = decltype(x);
  return static_cast<T>(sign_fill(x) ^ std::numeric_limits<T>::max());
};

// clang knows the clamped sum or difference of lanes in twice their bits for the processor's own instruction. g++ would
// compute it so.
#ifdef __clang__
template <class T>
constexpr bool clamps_wider = sizeof(T) < sizeof(int);
#else
template <class T>
constexpr bool clamps_wider = false;
#endif

// The wrapped sum has overflowed where its sign differs from that of both operands: of 8 bits, 100 + 100 = -56. No
// wider type is needed, so that a register holds all its lanes throughout.
constexpr auto ADDS = [](auto x, auto y) {
  using T = decltype(x);
  if constexpr (clamps_wider<T>) return saturate<T>(x + y);
  const T sum = static_cast<T>(ADD(x, y));
  return ((sum ^ x) & (sum ^ y)) < 0 ? bound_of(x) : sum;
};
// The wrapped difference has overflowed where the operands' signs differ and its own differs from that of x: of 8
// bits, 100 - -100 = -56.
constexpr auto SUBS = [](auto x, auto y) {
  using T = decltype(x);
  if constexpr (clamps_wider<T>) return saturate<T>(x - y);
  const T difference = static_cast<T>(SUB(x, y));
  return ((x ^ y) & (x ^ difference)) < 0 ? bound_of(x) : difference;
};
// The smallest value alone is negative before and after: of 8 bits, -(-128) wraps to -128. Adding -1 there wraps to
// 127.
constexpr auto NEGS = [](auto x) {
  using T = decltype(x);
  const T negative = static_cast<T>(NEG(x));
  return unsigned_bits(negative) + unsigned_bits(sign_fill(static_cast<T>(negative & x)));
};

// (x ^ s) - s with the sign fill s: x where s = 0; where s = -1, ~x + 1, which is -x.
constexpr auto ABS = [](auto x) {
  const auto sign = unsigned_bits(sign_fill(x));
  return static_cast<decltype(x)>((unsigned_bits(x) ^ sign) - sign);
};
// The smallest value alone is still negative: of 8 bits, |-128| wraps to -128. Adding -1 there wraps to 127.
constexpr auto ABSS = [](auto x) {
  const auto magnitude = ABS(x);
  return unsigned_bits(magnitude) + unsigned_bits(sign_fill(magnitude));
};

constexpr auto ABSSUB = [](auto x, auto y) { return SUB(x > y ? x : y, x > y ? y : x); };
constexpr auto ABSSSUB = [](auto x, auto y) { return ABSS(SUBS(x, y)); };

}  // namespace

#include "integer/stamp.h"

// The rule on every lane, and which lanes are negative.
#define KERNEL_unary_and_signs(OP, RULE, L)                                     \
  template <class Units, class Bits>                                            \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Bits* p, Units* r) { \
    lane_bits<L::bits, L::count>(                                               \
        p, [](auto x) { return x < 0; }, Read<L>(a));                           \
    lanes<L::count>(result<L>(r), RULE, Read<L>(a));                            \
  }

#include "integer/arithmetic.def"

#include "frame/stamp_end.h"
