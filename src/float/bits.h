// Numbers as bits, and masks made of signs: what the units that compute whole vectors have in common.
#ifndef KASTARRI_FLOAT_BITS_H
#define KASTARRI_FLOAT_BITS_H

#include <cstdint>
#include <cstring>
#include <type_traits>

#include "float/formats.h"
#include "frame/arithmetic.h"

namespace {

template <class To, class From>
inline To same_bits_as(From from) {
  static_assert(sizeof(To) == sizeof(From));
  To to;
  std::memcpy(&to, &from, sizeof to);
  return to;
}
inline float as_float(word bits) { return same_bits_as<float>(bits); }

// Rules for whole vectors choose between values by masks made of signs. Of a comparison the compiler
// makes a branch when that spares it a floating-point operation, and does not vectorise the branch.
template <class T>
constexpr T sign_mask(T x) {
  return static_cast<T>(static_cast<std::make_signed_t<T>>(x) >> (8 * sizeof(T) - 1));
}
// All ones where x < y, as signed numbers whose difference is one.
template <class T>
constexpr T mask_below(T x, T y) {
  return sign_mask(static_cast<T>(x - y));
}

constexpr word single_sign = Single::sign;
constexpr word single_magnitude = Single::sign - 1;

constexpr word single_bits_of_power(int exponent) {
  return static_cast<word>(exponent + Single::bias) << Single::fraction_bits;
}

// The largest number of a format, as a single.
template <class F>
constexpr word widened_largest = F::bits == 32 ? Single::largest
                                               : (single_bits_of_power(Half::bias + 1) - 1) & ~word{0x1FFF};

// In place of a Rounding: to the nearest integer, ties away from 0.
struct TiesAway {
  constexpr operator Rounding() const { return ties_away; }
};

// A rule on lanes, or one that asks for the mode too.
template <class Rule, class Mode, class... X>
inline auto by_rule(Rule rule, [[maybe_unused]] const Mode& mode, X... x) {
  if constexpr (std::is_invocable_v<Rule, Mode, X...>) {
    return rule(mode, x...);
  } else {
    return rule(x...);
  }
}

}  // namespace

#endif
