// Shifts by a count a lane.
#include "frame/arithmetic.h"

namespace {

// 2 to the power s mod 16, as a product of one factor a bit of s: the baseline target has no shift by
// a count a lane, but it multiplies.
constexpr auto power_of_two = [](std::int16_t s) {
  const auto factor = [s](int bit, int power) { return s & bit ? power : 1; };
  return static_cast<std::uint16_t>(factor(1, 2) * factor(2, 4) * factor(4, 16) * factor(8, 256));
};

// x * 2^(s mod 16) is x shifted left by s in its low half; for a negative s it is x shifted right by
// -s in its high half, since s mod 16 is then 16 - (-s).
constexpr auto SLL = [](std::int16_t x, std::int16_t s) {
  const std::uint32_t shifted = std::uint32_t{unsigned_bits(x)} * power_of_two(s);
  const auto left = static_cast<std::uint16_t>(shifted);
  const auto right = static_cast<std::uint16_t>(shifted >> 16);
  const bool within = static_cast<std::uint16_t>(s + 16) < 32;  // -16 .. 15; -16 gives 2^0, whose high half is 0
  return static_cast<std::uint16_t>(within ? s < 0 ? right : left : 0);
};

// An arithmetic shift right is the logical one of the value with its sign folded away.
constexpr auto SRA = [](std::int16_t x, std::int16_t s) {
  const auto sign = static_cast<std::uint16_t>(sign_fill(x));
  const auto negated = static_cast<std::int16_t>(s == -0x8000 ? 0x7FFF : -s);
  const std::uint16_t right = SLL(static_cast<std::int16_t>(x ^ sign), negated) ^ sign;
  const std::uint16_t left = SLL(x, negated);
  return static_cast<std::uint16_t>(s < 0 ? left : right);
};

}  // namespace

#include "frame/stamp.h"

#include "integer/shifts.def"

#include "frame/stamp_end.h"
