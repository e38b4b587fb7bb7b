// Shifts by a count a lane.
#include "integer/kernels.h"
#include "integer/scale.h"

namespace {

constexpr auto is_negative = [](auto count) { return static_cast<std::make_signed_t<decltype(count)>>(count) < 0; };

constexpr auto SLL = [](auto x, auto count) {
  using U = decltype(x);
  const Scaled<U> product(x, count);
  const U shifted = is_negative(count) ? product.high : product.low;
  return within(count) ? shifted : U{0};
};
constexpr auto SRL = [](auto x, auto count) { return SLL(x, static_cast<decltype(x)>(0u - count)); };

// A signed lane shifted by a count, left and, when the count is negative, right. The product is one of
// the lane with its sign folded away.
template <class T>
struct ShiftedSigned {
  using U = std::make_unsigned_t<T>;
  constexpr ShiftedSigned(T x, U count) {
    const U sign = unsigned_bits(sign_fill(x));
    const Scaled<U> folded(static_cast<U>(unsigned_bits(x) ^ sign), count);
    // -1 - f times p is -1 - f * p, less the p - 1 that the -1 lacks.
    const U product = static_cast<U>((folded.low ^ sign) - (static_cast<U>(folded.power - 1u) & sign));
    left = within(count) ? product : U{0};
    right = static_cast<U>((within(count) ? folded.high : U{0}) ^ sign);
    const U beyond = static_cast<U>(folded.high | folded.low >> (width<U> - 1));
    fits = x == 0 || (within(count) && beyond == 0);
  }
  U left, right;
  bool fits;
};

constexpr auto SRA = [](auto x, auto count) {
  using T = decltype(x);
  const ShiftedSigned<T> shifted(x, static_cast<std::make_unsigned_t<T>>(0u - unsigned_bits(count)));
  return count > 0 ? shifted.right : shifted.left;
};

constexpr auto SLS = [](auto x, auto count) {
  using T = decltype(x);
  const ShiftedSigned<T> shifted(x, unsigned_bits(count));
  const auto bound = unsigned_bits(static_cast<T>(sign_fill(x) ^ std::numeric_limits<T>::max()));
  return count < 0 ? shifted.right : shifted.fits ? shifted.left : bound;
};

}  // namespace

#include "frame/stamp.h"

#include "integer/shifts.def"

#include "frame/stamp_end.h"
