// The two formats, IEEE 754 binary16 and binary32, as bit patterns; and the floating-point environment
// of one call.
#ifndef KASTARRI_FLOAT_FORMATS_H
#define KASTARRI_FLOAT_FORMATS_H

#include <cstdint>
#include <type_traits>

#include "frame/layouts.h"
#include "kastarri/state.h"

namespace {

template <class Lane, int ExponentBits, int FractionBits>
struct Format {
  using lane = Lane;
  static constexpr int bits = 1 + ExponentBits + FractionBits;
  static constexpr int fraction_bits = FractionBits;
  static constexpr int bias = (1 << (ExponentBits - 1)) - 1;
  // Of normal numbers; the lowest bit of a subnormal number weighs 2^least_quantum.
  static constexpr int least_exponent = 1 - bias;
  static constexpr int greatest_exponent = bias;
  static constexpr int least_quantum = least_exponent - FractionBits;

  static constexpr word sign = word{1} << (bits - 1);
  static constexpr word unit = word{1} << FractionBits;  // the least normal number; the hidden bit
  static constexpr word infinity = ((word{1} << ExponentBits) - 1) << FractionBits;
  static constexpr word largest = infinity - 1;
  static constexpr word quiet = unit >> 1;
  static constexpr word default_nan = infinity | quiet;
  static constexpr word one = word{bias} << FractionBits;
};

using Half = Format<std::uint16_t, 5, 10>;
using Single = Format<std::uint32_t, 8, 23>;

// The format of a layout's lanes.
template <class L>
using format_of = std::conditional_t<L::bits == 16, Half, Single>;

template <class F>
constexpr word magnitude(word x) {
  return x & (F::sign - 1);
}
template <class F>
constexpr bool is_nan(word x) {
  return magnitude<F>(x) > F::infinity;
}
template <class F>
constexpr bool is_signalling(word x) {
  return is_nan<F>(x) && !(x & F::quiet);
}
template <class F>
constexpr bool is_infinite(word x) {
  return magnitude<F>(x) == F::infinity;
}
template <class F>
constexpr bool is_zero(word x) {
  return magnitude<F>(x) == 0;
}
template <class F>
constexpr bool is_negative(word x) {
  return (x & F::sign) != 0;
}

// As RoundMode counts them; ties_away is for one rounding to an integer only.
enum Rounding : word { to_nearest, toward_zero, upward, downward, ties_away };

// As StickyFlags has them.
enum Flag : word { inexact = 1, underflow = 2, overflow = 4, division_by_zero = 8, invalid = 16 };
constexpr word all_flags = 31;

inline Rounding round_mode() { return static_cast<Rounding>(cstub_Km_ZNB_Orbis_R5_64k_proc.states.RoundMode & 3); }
inline void raise_sticky(word flags) { cstub_Km_ZNB_Orbis_R5_64k_proc.states.StickyFlags |= flags; }
inline bool is_raised(Flag flag) { return (cstub_Km_ZNB_Orbis_R5_64k_proc.states.StickyFlags & flag) != 0; }

// What one call of the reference sees of the floating-point state: RoundMode as it stands when the call begins, and the
// flags that it raises, which join the sticky ones when it ends.
class Environment {
 public:
  Environment() : Environment(round_mode()) {}
  explicit Environment(Rounding by) : rounding(by) {}
  ~Environment() { raise_sticky(raised_); }
  Environment(const Environment&) = delete;
  Environment& operator=(const Environment&) = delete;

  void raise(word flags) { raised_ |= flags; }
  void forget() { raised_ = 0; }

  const Rounding rounding;

 private:
  word raised_ = 0;
};

}  // namespace

#endif
