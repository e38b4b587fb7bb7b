// Narrow products: 16 bits of a 16-bit product, and transfers of sign.
#include "multiply/fractions.h"
#include "multiply/products.h"

namespace {

constexpr auto PACKL = [](std::int16_t a, std::int16_t b) { return static_cast<std::uint16_t>(product(a, b)); };
constexpr auto PACKQ = [](std::int16_t a, std::int16_t b) { return q15(unsigned_bits(product(a, b))); };
constexpr auto PACKP = [](std::int16_t a, std::int16_t b) { return q10(unsigned_bits(product(a, b))); };

// b with the sign of a; 0 when a is 0.
constexpr auto SGN = [](auto a, auto b) {
  using T = decltype(b);
  return static_cast<T>(a < 0 ? 0 - unsigned_bits(b) : a > 0 ? unsigned_bits(b) : 0);
};
// The smallest number has no negative in its lane: the largest stands for it.
constexpr auto SGNS = [](auto a, auto b) {
  using T = decltype(b);
  const T negative = static_cast<T>(0 - unsigned_bits(b));
  const T saturated = static_cast<T>(negative - (negative == std::numeric_limits<T>::min()));
  return static_cast<T>(a < 0 ? saturated : a > 0 ? b : 0);
};

}  // namespace

#include "multiply/stamp.h"

#include "multiply/narrow.def"

#include "frame/stamp_end.h"
