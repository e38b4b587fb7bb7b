// Integer arithmetic that the families share: bounds of lanes, saturation, choice.
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

// Bit by bit: one number where the mask has a 1, another elsewhere.
template <class T>
constexpr T chosen(T mask, T where_set, T elsewhere) {
  return (mask & where_set) | (~mask & elsewhere);
}

}  // namespace

#endif
