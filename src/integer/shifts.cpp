// Shifts by a count a lane.
#include "integer/kernels.h"
#include "frame/scale.h"

namespace {

constexpr auto is_negative = [](auto count) { return static_cast<std::make_signed_t<decltype(count)>>(count) < 0; };

constexpr auto SLL = [](auto x, auto count) {
  using U = decltype(x);
  const Scaled<U> product(x, count);
  const U shifted = is_negative(count) ? product.high : product.low;
  return within(count) ? shifted : U{0};
};
constexpr auto SRL = [](auto x, auto count) { return SLL(x, static_cast<decltype(x)>(0u - count)); };

// A signed lane times p = 2^(count mod w). It is folded first: f = x for x >= 0, f = -1 - x (that is ~x) for x < 0, so
// that -3 becomes 2. The product f * p has the shift right of f in its high half, and the shift left of x stays in
// range while f * p < 2^(w-1). Unfolding turns the bits of what becomes of a negative lane.
template <class T>
struct ScaledSigned {
  using U = std::make_unsigned_t<T>;
  ScaledSigned(T x, U count)
      : sign(unsigned_bits(sign_fill(x))), folded(static_cast<U>(unsigned_bits(x) ^ sign), count) {}

  // Folded: x * p = (-1 - f) * p = -1 - (f * p + p - 1).
  U left() const { return static_cast<U>(folded.low + (static_cast<U>(folded.power - 1u) & sign)); }
  U right() const { return folded.high; }
  // All ones when the shift left does not stay in range, else 0.
  U out_of_range() const {
    return static_cast<U>(folded.high | folded.low >> (width<U> - 1)) == 0 ? U{0} : static_cast<U>(-1);
  }

  U sign;
  Scaled<U> folded;
};

// A count of w - 1 in place of greater ones gives the same. Shifted right it leaves the sign; shifted left and
// saturated, the end of the range, or 0.
constexpr auto at_most_the_width = [](auto count) {
  using T = decltype(count);
  constexpr T farthest = width<T> - 1;
  return count < farthest ? count : farthest;
};

constexpr auto SRA = [](auto x, auto count) {
  using T = decltype(x);
  using U = std::make_unsigned_t<T>;
  const ScaledSigned<T> scaled(x, static_cast<U>(0u - unsigned_bits(at_most_the_width(count))));
  const auto right = static_cast<U>(scaled.right() ^ scaled.sign);
  const auto left = static_cast<U>(count > -width<T> ? scaled.left() ^ scaled.sign : 0);
  return count > 0 ? right : left;
};

// With masks in place of ?:, of which compilers make many more instructions here.
constexpr auto SLS = [](auto x, auto count) {
  using T = decltype(x);
  using U = std::make_unsigned_t<T>;
  const ScaledSigned<T> scaled(x, unsigned_bits(at_most_the_width(count)));
  const U right = count >= -width<T> ? scaled.right() : U{0};
  const U left = static_cast<U>((scaled.left() | scaled.out_of_range()) & unsigned_bits(std::numeric_limits<T>::max()));
  const U backward = unsigned_bits(sign_fill(count));
  return static_cast<U>(((right & backward) | (left & ~backward)) ^ scaled.sign);
};

}  // namespace

#include "integer/stamp.h"

#include "integer/shifts.def"

#include "frame/stamp_end.h"
