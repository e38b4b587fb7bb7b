// Integer arithmetic that the families share: bounds of lanes and saturation.
#ifndef KASTARRI_FRAME_ARITHMETIC_H
#define KASTARRI_FRAME_ARITHMETIC_H

#include <cstdint>
#include <limits>
#include <type_traits>

namespace {

// The bits of a lane as an unsigned number: arithmetic on it wraps and never overflows.
template <class T>
constexpr std::make_unsigned_t<T> unsigned_bits(T lane) {
  return static_cast<std::make_unsigned_t<T>>(lane);
}

// v clamped to the range of Lane.
template <class Lane, class V>
constexpr Lane saturate(V v) {
  constexpr V low = std::numeric_limits<Lane>::min();
  constexpr V high = std::numeric_limits<Lane>::max();
  return static_cast<Lane>(v < low ? low : v > high ? high : v);
}

// All ones when the lane is negative, else 0.
template <class T>
constexpr T sign_fill(T lane) {
  return static_cast<T>(lane < 0 ? -1 : 0);
}

// x shifted right by s, copies of the sign shifted in: floor(x / 2^s). All lanes share s, which is less
// than the width. The shift is an unsigned one of x + 2^(w-1): for a signed shift by a run-time count
// the compiler takes the count through memory in two halves, which costs more than all the rest.
template <class T, class Count>
constexpr T shift_right(T x, Count s) {
  using U = std::make_unsigned_t<T>;
  constexpr U top = static_cast<U>(U{1} << (8 * sizeof(T) - 1));
  return static_cast<T>(static_cast<U>((unsigned_bits(x) ^ top) >> s) - static_cast<U>(top >> s));
}

}  // namespace

#endif
