// A lane times a power of two: shifts and rotations by a count a lane. SSE2 has no shift by a count a lane, but it
// multiplies, and one product holds two shifts. Of 16 bits, x * 2^3 = 2^16 high + low, where low is x << 3 and high is
// x >> 13.
#ifndef KASTARRI_FRAME_SCALE_H
#define KASTARRI_FRAME_SCALE_H

#include "frame/arithmetic.h"

namespace {

template <class T>
constexpr int width = 8 * sizeof(T);

// Whether the target shifts words by a count a lane.
#ifdef __AVX2__
constexpr bool shifts_words_by_lane = true;
#else
constexpr bool shifts_words_by_lane = false;
#endif

// 2^(t mod 16), bit by bit of t.
constexpr std::uint16_t power_of_two(std::uint16_t t) {
  const auto factor = [t](int bit, int power) { return t & bit ? power : 1; };
  return static_cast<std::uint16_t>(factor(1, 2) * factor(2, 4) * factor(4, 16) * factor(8, 256));
}

// 2^(t mod 32), by the number with that exponent: converting it is exact, whatever the host's rounding.
inline std::uint32_t power_of_two(std::uint32_t t) {
  if constexpr (shifts_words_by_lane) return std::uint32_t{1} << (t & 31);
  const auto number = __builtin_bit_cast(float, ((t & 15) + 127) << 23);
  const auto power = static_cast<std::uint32_t>(static_cast<std::int32_t>(number));
  return t & 16 ? power << 16 : power;
}

// x * 2^(t mod w) in twice the width.
struct Scaled16 {
  Scaled16(std::uint16_t x, std::uint16_t t)
      : power(power_of_two(t)),
        low(static_cast<std::uint16_t>(x * std::uint32_t{power})),
        high(static_cast<std::uint16_t>(x * std::uint32_t{power} >> 16)) {}
  std::uint16_t power, low, high;
};
struct Scaled32 {
  Scaled32(std::uint32_t x, std::uint32_t t) : power(power_of_two(t)) {
    if constexpr (shifts_words_by_lane) {
      low = x << (t & 31);
      high = x >> 1 >> (~t & 31);
    } else {
      const std::uint64_t product = std::uint64_t{x} * power;
      low = static_cast<std::uint32_t>(product);
      high = static_cast<std::uint32_t>(product >> 32);
    }
  }
  std::uint32_t power, low, high;
};
template <class U>
using Scaled = std::conditional_t<sizeof(U) == 2, Scaled16, Scaled32>;

// Whether a count is from -w to w - 1; by others nothing is left of a lane of w bits. Nothing is left by -w either, but
// that comes out right by itself: 2^(-w mod w) is 1, and the high half of x * 1 is 0.
template <class U>
constexpr bool within(U count) {
  return static_cast<U>(count + width<U>) < 2 * width<U>;
}

}  // namespace

#endif
