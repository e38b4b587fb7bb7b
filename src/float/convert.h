// Conversions by value: between integers and numbers, and between the formats.
#ifndef KASTARRI_FLOAT_CONVERT_H
#define KASTARRI_FLOAT_CONVERT_H

#include "float/reference.h"
#include "float/unit.h"
#include "frame/lanes.h"

namespace {

template <class L>
constexpr bool is_float =
    std::is_same_v<typename L::number, half_float> || std::is_same_v<typename L::number, single_float>;

// Scales are read modulo the width of the integer.
template <class Integer>
constexpr word scale_of(word immediate) {
  return immediate & (Integer::bits - 1);
}

// One lane by the reference: an integer divided by 2^scale as a number; a number times 2^scale as an
// integer; a number in the other format.
template <class From, class To>
inline typename To::container convert_lane(Environment& env, typename From::container lane, word scale) {
  if constexpr (!is_float<From>) {
    return static_cast<typename To::container>(from_integer<format_of<To>>(env, lane, scale));
  } else if constexpr (!is_float<To>) {
    constexpr bool is_signed = std::is_signed_v<typename To::container>;
    return static_cast<typename To::container>(to_integer<format_of<From>, To::bits, is_signed>(env, lane, scale));
  } else {
    return static_cast<typename To::container>(change_format<format_of<From>, format_of<To>>(env, lane));
  }
}

// --- On the unit: a whole vector -----------------------------------------------------------------------

template <class From, class To, class Out, class Units>
[[gnu::always_inline]] inline void convert_register(Out* out, const Units* in, word scale) {
  const Rounding mode = round_mode();
  const auto exact = [=](auto lane) {
    Environment env(mode);
    return convert_lane<From, To>(env, lane, scale);
  };
  if constexpr (From::count == 1 || To::count == 1) {
    lanes<To::count>(Write<To>(out), SAME, Same(exact(Read<From>(in)[0])));
  } else if constexpr (!is_float<To>) {
    store_truncated<To, From>(out, scale, exact, in);
  } else {
    const float unit = as_float(single_bits_of_power(-static_cast<int>(scale)));
    const auto rule = [=](auto x) {
      if constexpr (is_float<From>) return exact_single_of(x);
      if constexpr (!is_float<From>) return scaled_single(x, unit);
    };
    store_by_rule<To, From>(out, mode, true, rule, exact, in);
  }
}

}  // namespace

#endif
