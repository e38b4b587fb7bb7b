// Shifts by a count a lane.
#include "frame/arithmetic.h"

namespace {

// 2 to the power s mod 16, as a product of one factor a bit of s: the baseline target has no shift by
// a count a lane, but it multiplies.
constexpr auto power_of_two = [](std::int16_t s) {
  const auto factor = [s](int bit, int power) { return s & bit ? power : 1; };
  return static_cast<std::uint16_t>(factor(1, 2) * factor(2, 4) * factor(4, 16) * factor(8, 256));
};

// A count from -16 to 15 shifts by itself; beyond, every bit leaves the lane. (-16 is among them since
// shifting by 2^0 leaves nothing in the high half.)
constexpr auto within = [](std::int16_t s) { return static_cast<std::uint16_t>(s + 16) < 32; };

// x * 2^(s mod 16) is x shifted left by s in its low half; for a negative s it is x shifted right by
// -s in its high half, since s mod 16 is then 16 - (-s).
constexpr auto SLL = [](std::int16_t x, std::int16_t s) {
  const std::uint32_t shifted = std::uint32_t{unsigned_bits(x)} * power_of_two(s);
  const auto left = static_cast<std::uint16_t>(shifted);
  const auto right = static_cast<std::uint16_t>(shifted >> 16);
  return static_cast<std::uint16_t>(within(s) ? s < 0 ? right : left : 0);
};

// The same with the count mirrored; an arithmetic shift right is the logical one of the value with its
// sign folded away.
constexpr auto SRA = [](std::int16_t x, std::int16_t s) {
  const auto sign = static_cast<std::uint16_t>(sign_fill(x));
  const auto folded = static_cast<std::uint16_t>(x ^ sign);
  const auto count = static_cast<std::int16_t>(-s);
  const std::uint16_t power = power_of_two(count);
  const auto left = static_cast<std::uint16_t>(unsigned_bits(x) * std::uint32_t{power});
  const auto right = static_cast<std::uint16_t>(folded * std::uint32_t{power} >> 16);
  const auto kept = [&](std::uint16_t shifted) { return static_cast<std::uint16_t>(within(count) ? shifted : 0); };
  return static_cast<std::uint16_t>(s > 0 ? kept(right) ^ sign : kept(left));
};

}  // namespace

#include "frame/stamp.h"

#include "integer/shifts.def"

#include "frame/stamp_end.h"
