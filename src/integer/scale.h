// A lane times a power of two: shifts and rotations by a count a lane. The baseline target has no shift by
// a count a lane, but it multiplies; one product holds the shift left in its low half and the shift right
// by the rest of the width in its high half.
#ifndef KASTARRI_INTEGER_SCALE_H
#define KASTARRI_INTEGER_SCALE_H

#include "frame/arithmetic.h"

namespace {

template <class T>
constexpr int width = 8 * sizeof(T);

// 2^(t mod w), bit by bit of t.
template <class U, int Bit = width<U> / 2>
constexpr U power_of_two(U t) {
  if constexpr (Bit == 1) {
    return static_cast<U>(1 + (t & 1));
  } else {
    const U power = power_of_two<U, Bit / 2>(t);
    return t & Bit ? static_cast<U>(power << Bit) : power;
  }
}

// x * 2^(t mod w) in twice the width.
template <class U>
struct Scaled {
  using Wide = std::conditional_t<sizeof(U) == 2, std::uint32_t, std::uint64_t>;
  constexpr Scaled(U x, U t) : power(power_of_two(t)), low(static_cast<U>(x * std::uint32_t{power})), high(static_cast<U>(Wide{x} * power >> width<U>)) {}
  U power, low, high;
};

// Whether a count from -w to w - 1 leaves something of a lane. (-w is among them since the high half of
// a product with 2^0 is 0.)
template <class U>
constexpr bool within(U count) {
  return static_cast<U>(count + width<U>) < 2 * width<U>;
}

}  // namespace

#endif
