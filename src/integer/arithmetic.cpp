// Addition, subtraction, negation, absolute values.
#include "frame/arithmetic.h"

#include "integer/kernels.h"

namespace {

// Rules. x and y are lanes of one type; what a rule returns is cut to the lane.

constexpr auto ADD = [](auto x, auto y) { return unsigned_bits(x) + unsigned_bits(y); };
constexpr auto SUB = [](auto x, auto y) { return unsigned_bits(x) - unsigned_bits(y); };
constexpr auto NEG = [](auto x) { return 0u - unsigned_bits(x); };

// The bound on the side of x: the sign fill with its top bit turned.
constexpr auto bound_of = [](auto x) {
  using T = decltype(x);
  return static_cast<T>(sign_fill(x) ^ std::numeric_limits<T>::max());
};

// On overflow both operands have the sign that the wrapped sum has not. Staying within the lane's width
// is twice as fast as widening.
constexpr auto ADDS = [](auto x, auto y) {
  using T = decltype(x);
  const T sum = static_cast<T>(ADD(x, y));
  return ((sum ^ x) & (sum ^ y)) < 0 ? bound_of(x) : sum;
};
// The same where the operands' signs differ and the difference has not the sign of x.
constexpr auto SUBS = [](auto x, auto y) {
  using T = decltype(x);
  const T difference = static_cast<T>(SUB(x, y));
  return ((x ^ y) & (x ^ difference)) < 0 ? bound_of(x) : difference;
};
// Only the most negative value keeps its sign when negated, and one less is the bound.
constexpr auto NEGS = [](auto x) {
  using T = decltype(x);
  const T negative = static_cast<T>(NEG(x));
  return unsigned_bits(negative) + unsigned_bits(sign_fill(static_cast<T>(negative & x)));
};

// Turning all bits of a negative number and adding 1, by its sign fill.
constexpr auto ABS = [](auto x) {
  const auto sign = unsigned_bits(sign_fill(x));
  return static_cast<decltype(x)>((unsigned_bits(x) ^ sign) - sign);
};
// Only the most negative value is still negative, and one less is the bound.
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
