// Conversions by value: between integers and numbers, and between the formats.
#ifndef KASTARRI_FLOAT_CONVERT_H
#define KASTARRI_FLOAT_CONVERT_H

#include "float/host.h"
#include "float/reference.h"

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

// --- On the host's unit: a whole vector --------------------------------------------------------------------

// An integer as a single, rounded once. One of 32 bits without a sign is put together from exact halves.
template <class T>
inline float single_of(T integer) {
  if constexpr (std::is_same_v<T, std::uint32_t>) {
    const auto high = static_cast<float>(static_cast<std::int32_t>(integer >> 16));
    return high * 0x1p16f + static_cast<float>(static_cast<std::int32_t>(integer & 0xFFFF));
  } else {
    return static_cast<float>(integer);
  }
}

// x truncated to an integer of To. Out of range, or a NaN, it is left.
template <class To>
inline word truncated(float x, Left& left) {
  constexpr bool is_signed = std::is_signed_v<typename To::container>;
  const word absolute = bits_of(x) & single_magnitude;
  const word negative = sign_mask(bits_of(x));
  const word bound = is_signed ? single_bits_of_power(To::bits - 1)
                               : (negative & Single::one) | (~negative & single_bits_of_power(To::bits));
  const word within = mask_below(absolute, bound);
  left |= ~within;
  const float kept = as_float(bits_of(x) & within);
  if constexpr (is_signed || To::bits < 32) {
    return static_cast<word>(static_cast<std::int32_t>(kept));
  } else {
    // The unit converts to signed integers only: bit 31 goes over by itself.
    const word high = within & ~mask_below(absolute, single_bits_of_power(31));
    const float low = kept - as_float(high & single_bits_of_power(31));
    return static_cast<word>(static_cast<std::int32_t>(low)) | (high & single_sign);
  }
}

// A whole vector on the host's unit, or, when it leaves a lane, by the reference altogether: a lane that
// is left may have raised flags of its own.
template <class From, class To, class Out, class Units, class Fast, class Exact>
inline void convert_vector(Out* out, const Units* in, Fast fast, Exact exact) {
  alignas(64) typename To::container results[To::count];
  Environment env;
  const HostResult host = on_host<To, From>(env.rounding, results, fast, in);
  if (__builtin_expect(host.some_left, 0)) {
    const Read<From> from(in);
    for (int i = 0; i < To::count; ++i) results[i] = exact(env, from[i]);
  } else {
    env.raise(host.flags);
  }
  lanes<To::count>(
      Write<To>(out), [](auto lane) { return lane; }, Read<To>(results));
}

template <class From, class To, class Out, class Units>
inline void convert_register(Out* out, const Units* in, word scale) {
  const auto exact = [scale](Environment& env, auto lane) { return convert_lane<From, To>(env, lane, scale); };
  if constexpr (From::count == 1 || To::count == 1) {
    Environment env;
    const auto lane = exact(env, Read<From>(in)[0]);
    lanes<To::count>(
        Write<To>(out), [](auto same) { return same; }, Same(lane));
  } else if constexpr (!is_float<From>) {
    const float unit = as_float(single_bits_of_power(-static_cast<int>(scale)));
    convert_vector<From, To>(
        out, in, [unit](auto integer) { return single_of(integer) * unit; }, exact);
  } else if constexpr (!is_float<To>) {
    const float power = as_float(single_bits_of_power(static_cast<int>(scale)));
    convert_vector<From, To>(
        out, in, [power](Left& left, float x) { return truncated<To>(x * power, left); }, exact);
  } else {
    convert_vector<From, To>(
        out, in, [](float x) { return x; }, exact);
  }
}

}  // namespace

#endif
