// The host's floating-point unit as a fast path for whole vectors.
//
// Its single-precision addition, multiplication, fused multiply-add and conversions are those of the
// core: IEEE 754, one rounding, underflow told by tininess after rounding. They differ in two things
// alone. NaNs: so a lane whose result is a NaN is left to the reference, and the invalid flag with it,
// for nothing else raises that. And the control word, which is the host program's: so HostFpu sets it
// and puts it back.
//
// Half precision is computed in single precision, in which every half is a number, subnormals too:
//   products   11 x 11 bits are exact in 24, exponents far within range;
//   sums       rounded to 24 bits, then to 11: rounding twice is rounding once. In the directed modes
//              that is always so; to nearest since 24 >= 2 * 11 + 2; sums below the least normal half
//              are exact;
//   fused      the exact product, then the sum rounded to odd (odd_sum).
// Inexact, told by either rounding, is then told rightly. Lanes that overflow, or underflow inexactly,
// are left to the reference.
#ifndef KASTARRI_FLOAT_HOST_H
#define KASTARRI_FLOAT_HOST_H

#include <cstdint>
#include <cstring>

#include "float/formats.h"
#include "frame/lanes.h"

namespace {

// From its beginning to leave(): MXCSR with a rounding of ours, every exception masked, subnormals
// honoured, no flags. Compilers know nothing of MXCSR and move arithmetic past its writes; they cannot
// where operands are read through pointers, and results written through them, that pass here as outputs
// of an assembler statement between the writes: what a load yields is unknown before the one write, and a
// store must be done before the other, which may read any memory.
class HostFpu {
 public:
  template <class... Pointers>
  explicit HostFpu(Rounding rounding, Pointers&... operands_and_results) {
    asm volatile("stmxcsr %0" : "=m"(found_));
    // MXCSR counts the modes nearest, down, up, zero.
    const word wanted = all_masked | ((4 - static_cast<word>(rounding)) & 3) << 13;
    asm volatile("ldmxcsr %0" : : "m"(wanted) : "memory");
    (pin(operands_and_results), ...);
  }
  HostFpu(const HostFpu&) = delete;
  HostFpu& operator=(const HostFpu&) = delete;

  // Puts MXCSR back. Of the flags raised since, those that count: inexact, underflow, overflow.
  word leave() const {
    word raised;
    asm volatile("stmxcsr %0" : "=m"(raised) : : "memory");
    asm volatile("ldmxcsr %0" : : "m"(found_) : "memory");
    return (raised >> 5 & inexact) | (raised >> 3 & underflow) | (raised >> 1 & overflow);
  }

 private:
  static constexpr word all_masked = 0x1F80;

  template <class Pointer>
  static void pin(Pointer& pointer) {
    asm volatile("" : "+r"(pointer) : : "memory");
  }

  word found_;
};

template <class To, class From>
inline To same_bits_as(From from) {
  static_assert(sizeof(To) == sizeof(From));
  To to;
  std::memcpy(&to, &from, sizeof to);
  return to;
}
inline float as_float(word bits) { return same_bits_as<float>(bits); }
inline word bits_of(float x) { return same_bits_as<word>(x); }

constexpr word single_sign = Single::sign;
constexpr word single_magnitude = Single::sign - 1;

// What a loop learns about its lanes: bit 31 is set when one is left to the reference.
using Left = word;
constexpr bool some_left(Left left) { return left >> 31 != 0; }
// All magnitudes are below 2^31, so a difference of two has its sign in bit 31.
constexpr Left left_above(word magnitude, word bound) { return bound - magnitude; }

constexpr word single_bits_of_power(int exponent) { return static_cast<word>(exponent + Single::bias) << Single::fraction_bits; }

// A half as a single. As the low bits of one it is 2^-112 times itself; only the exponent of infinity
// and NaN has to be told.
inline float widen(word half) {
  const word absolute = (half & 0x7FFF) << 13;
  const word special = absolute >= Half::infinity << 13 ? Single::infinity : 0;
  const float number = as_float(absolute | special) * 0x1p112f;
  return as_float(bits_of(number) | (half & 0x8000) << 16);
}

// A single rounded to half precision. Adding 2^13 times the power of two of its exponent, or of the
// least normal half's if that is more, leaves just the bits that the half has room for, rounded and
// flagged by the unit itself. A lane that is left comes out as a NaN.
inline word narrow(float x, Left& left) {
  const word sign = bits_of(x) & single_sign;
  const word absolute = bits_of(x) & single_magnitude;
  const word least_normal = single_bits_of_power(Half::least_exponent);
  const word power = absolute & Single::infinity;
  const float pull = as_float(((power > least_normal ? power : least_normal) + (word{13} << 23)) | sign);
  const float kept = (x + pull) - pull;
  const word rounded = bits_of(kept) & single_magnitude;
  const word largest = single_bits_of_power(Half::greatest_exponent + 1) - (word{1} << 13);
  const word tiny_inexact = rounded != absolute && absolute < least_normal ? word{0x80000000} : 0;
  const Left leave = left_above(rounded, largest) | tiny_inexact;
  left |= leave;
  const word half = bits_of(as_float(rounded) * 0x1p-112f) >> 13 | sign >> 16;
  return leave >> 31 ? Half::default_nan : half;
}

// p + c for a p that is the exact product of two numbers of the narrower format F, such that rounding
// the sum again to F is rounding once. Nothing over- or underflows, the range being twice that of F.
//
// To nearest, the sum is rounded to odd: of the two neighbours of an inexact sum the one with the last
// bit 1, which the second rounding takes for neither a tie nor a number of F. That needs two bits more
// than F has. The error of the sum is exact (Knuth).
//
// In a directed mode any rounding in between does. But the sum may come out as a subnormal number of F,
// and then the second rounding does not know that it is inexact; so all such are left, as a NaN.
template <class F, bool Nearest, class Wide>
inline Wide odd_sum(Wide p, Wide c) {
  using Bits = std::conditional_t<sizeof(Wide) == 4, std::uint32_t, std::uint64_t>;
  constexpr bool is_double = sizeof(Wide) == 8;
  constexpr int fraction_bits = is_double ? 52 : Single::fraction_bits;
  constexpr Bits sign = Bits{1} << (8 * sizeof(Bits) - 1);
  constexpr Bits infinity = sign - (Bits{1} << fraction_bits);
  const Wide s = p + c;
  const auto bits = same_bits_as<Bits>(s);
  if constexpr (Nearest) {
    const Wide back = s - p;
    const auto error = same_bits_as<Bits>((p - (s - back)) + (c - back));
    const bool adjust = (error & ~sign) != 0 && (bits & 1) == 0 && (bits & infinity) != infinity;
    const Bits step = ((bits ^ error) & sign) != 0 ? ~Bits{0} : Bits{1};
    return same_bits_as<Wide>(static_cast<Bits>(bits + (adjust ? step : Bits{0})));
  } else {
    constexpr int bias = is_double ? 1023 : Single::bias;
    constexpr Bits least_normal = Bits{F::least_exponent + bias} << fraction_bits;
    const bool subnormal = (bits & ~sign) != 0 && (bits & ~sign) < least_normal;
    return same_bits_as<Wide>(static_cast<Bits>(bits | (subnormal ? ~sign : Bits{0})));
  }
}

// acc + a * b in single precision, rounded once.
template <bool Nearest>
inline float fused(float acc, float a, float b) {
#if defined __FMA__
  return __builtin_fmaf(a, b, acc);
#else
  return static_cast<float>(odd_sum<Single, Nearest>(double{a} * double{b}, double{acc}));
#endif
}

// Lane i of an operand as the unit takes it, and of a result as the register does.
template <class L>
inline auto host_value(typename L::container lane) {
  if constexpr (std::is_same_v<typename L::number, half_float>) {
    return widen(lane);
  } else if constexpr (std::is_same_v<typename L::number, single_float>) {
    return as_float(lane);
  } else {
    return lane;
  }
}

template <class R>
inline word from_host(float x, Left& left) {
  if constexpr (std::is_same_v<typename R::number, half_float>) {
    return narrow(x, left);
  } else {
    left |= left_above(bits_of(x) & single_magnitude, Single::infinity);
    return bits_of(x);
  }
}

struct HostResult {
  word flags;
  bool some_left;
};

// Result lane i = rule(left, operand lanes i ...) on the unit. `results` are apart from the operands.
template <class R, class... Ls, class Lane, class Rule, class... Units>
inline HostResult on_host(Rounding rounding, Lane* results, Rule rule, const Units*... operands) {
  static_assert(sizeof(Lane) == sizeof(typename R::container));
  HostFpu fpu(rounding, results, operands...);
  Left left = 0;
  KASTARRI_LANES_INDEPENDENT
  for (int i = 0; i < R::count; ++i)
    results[i] = static_cast<Lane>(rule(left, host_value<Ls>(static_cast<const in_memory<typename Ls::container>*>(
                                                  static_cast<const void*>(operands))[i])...));
  return {fpu.leave(), some_left(left)};
}

}  // namespace

#endif
