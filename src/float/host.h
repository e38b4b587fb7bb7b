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
// Inexact, told by either rounding, is then told rightly. The unit's own conversion to half precision
// tells the rest; without it, lanes that overflow, or underflow inexactly, are left to the reference.
#ifndef KASTARRI_FLOAT_HOST_H
#define KASTARRI_FLOAT_HOST_H

#include <immintrin.h>

#include <cstdint>
#include <cstring>

#include "float/formats.h"
#include "frame/lanes.h"

namespace {

// What the pointer leads to is unknown before, and memory may be read after.
template <class Pointer>
inline void pin(Pointer& pointer) {
  asm volatile("" : "+r"(pointer) : : "memory");
}

// From its beginning to leave(): MXCSR with a rounding of ours, every exception masked, subnormals
// honoured, no flags. It is written only where it differs. Compilers know nothing of MXCSR
// and move arithmetic past its writes; they cannot where operands are read through pointers, and results written
// through them, that pass here as outputs of an assembler statement between the writes: what a load yields is unknown
// before the one write, and a store must be done before the other, which may read any memory.
class HostFpu {
 public:
  template <class... Pointers>
  explicit HostFpu(Rounding rounding, Pointers&... operands_and_results) {
    asm volatile("stmxcsr %0" : "=m"(found_));
    // MXCSR counts the modes nearest, down, up, zero.
    const word wanted = all_masked | ((4 - static_cast<word>(rounding)) & 3) << 13;
    if (found_ != wanted) asm volatile("ldmxcsr %0" : : "m"(wanted) : "memory");
    (pin(operands_and_results), ...);
  }
  HostFpu(const HostFpu&) = delete;
  HostFpu& operator=(const HostFpu&) = delete;

  // Puts MXCSR back. Of the flags raised since, those that count: inexact, underflow, overflow.
  word leave() const {
    word raised;
    asm volatile("stmxcsr %0" : "=m"(raised) : : "memory");
    if (raised != found_) asm volatile("ldmxcsr %0" : : "m"(found_) : "memory");
    return (raised >> 5 & inexact) | (raised >> 3 & underflow) | (raised >> 1 & overflow);
  }

 private:
  static constexpr word all_masked = 0x1F80;
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

// Rules for whole vectors choose between values by masks made of signs. Of a comparison the compiler
// makes a branch when that spares it a floating-point operation, and does not vectorise the branch.
template <class T>
constexpr T sign_mask(T x) {
  return static_cast<T>(static_cast<std::make_signed_t<T>>(x) >> (8 * sizeof(T) - 1));
}
// For x and y below the top bit: all ones where x < y, where x is not 0.
template <class T>
constexpr T mask_below(T x, T y) {
  return sign_mask(static_cast<T>(x - y));
}
template <class T>
constexpr T mask_not_zero(T x) {
  return sign_mask(static_cast<T>(0 - x));
}

constexpr word single_sign = Single::sign;
constexpr word single_magnitude = Single::sign - 1;

// What a loop learns about its lanes: bit 31 is set when one is left to the reference.
using Left = word;
constexpr bool some_left(Left left) { return left >> 31 != 0; }
// All magnitudes are below 2^31, so a difference of two has its sign in bit 31.
constexpr Left left_above(word magnitude, word bound) { return bound - magnitude; }

constexpr word single_bits_of_power(int exponent) {
  return static_cast<word>(exponent + Single::bias) << Single::fraction_bits;
}

// A half as a single. As the low bits of one it is 2^-112 times itself; only the exponent of infinity
// and NaN has to be told.
inline float widen(word half) {
  const auto spread = static_cast<word>(static_cast<std::int32_t>(half << 16) >> 3);
  const word special = mask_below(word{Half::largest} << 13, spread & 0x0FFFE000) & Single::infinity;
  return as_float((spread & 0x8FFFE000) | special) * 0x1p112f;
}

// A single rounded to half precision. Adding 2^13 times the power of two of its exponent, or of the
// least normal half's if that is more, leaves just the bits that the half has room for, rounded and
// flagged by the unit itself. A lane that is left comes out as a NaN.
inline word narrow(float x, Left& left) {
  const word sign = bits_of(x) & single_sign;
  const word absolute = bits_of(x) & single_magnitude;
  const word least_normal = single_bits_of_power(Half::least_exponent);
  const word power = absolute & Single::infinity;
  const word small = mask_below(power, least_normal);
  const float pull = as_float(((power & ~small) | (least_normal & small)) + (word{13} << 23) + sign);
  const float kept = (x + pull) - pull;
  const word rounded = bits_of(kept) & single_magnitude;
  const word largest = single_bits_of_power(Half::greatest_exponent + 1) - (word{1} << 13);
  const word tiny_inexact = (0 - (rounded ^ absolute)) & (absolute - least_normal);  // in bit 31
  const Left leave = left_above(rounded, largest) | tiny_inexact;
  left |= leave;
  const word half = bits_of(as_float(rounded) * 0x1p-112f) >> 13 | sign >> 16;
  return half | (sign_mask(leave) & (Half::sign - 1));
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
template <class F, bool Nearest, bool Alone = false, class Wide>
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
    const Wide rounded_off = (p - (s - back)) + (c - back);
    if (Alone && rounded_off == 0) return s;  // one lane may branch: most sums are exact
    const auto error = same_bits_as<Bits>(rounded_off);
    const Bits even = (bits & 1) - 1;
    const Bits adjust = mask_not_zero(error & ~sign) & even & mask_below(bits & ~sign, infinity);
    const Bits step = sign_mask(bits ^ error) | 1;
    return same_bits_as<Wide>(bits + (adjust & step));
  } else {
    constexpr int bias = is_double ? 1023 : Single::bias;
    constexpr Bits least_normal = Bits{F::least_exponent + bias} << fraction_bits;
    const Bits subnormal = mask_not_zero(bits & ~sign) & mask_below(bits & ~sign, least_normal);
    return same_bits_as<Wide>(bits | (subnormal & ~sign));
  }
}

// acc + a * b in single precision, such that rounding it to half precision is rounding once.
template <bool Nearest>
inline float fused_for_half(float acc, float a, float b) {
  return odd_sum<Half, Nearest>(a * b, acc);
}

// acc + a * b in single precision, rounded once.
template <bool Nearest, bool Alone>
inline float fused(float acc, float a, float b) {
#if defined __FMA__
  return __builtin_fmaf(a, b, acc);
#else
  return static_cast<float>(odd_sum<Single, Nearest, Alone>(double{a} * double{b}, double{acc}));
#endif
}

// --- Integers -----------------------------------------------------------------------------------------

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

// --- Lanes ------------------------------------------------------------------------------------------

// The lanes of an operand as the unit takes them: singles and integers where they lie, halves widened.
template <class L, class = typename L::number>
class HostOperand {
 public:
  explicit HostOperand(const void* lanes) : lanes_(static_cast<const in_memory<typename L::container>*>(lanes)) {}
  auto operator[](int i) const {
    if constexpr (std::is_same_v<typename L::number, single_float>) {
      return as_float(lanes_[i]);
    } else {
      return typename L::container{lanes_[i]};
    }
  }

 private:
  const in_memory<typename L::container>* lanes_;
};

template <class L>
class HostOperand<L, half_float> {
 public:
  explicit HostOperand(const void* lanes) {
    const in_memory<std::uint16_t>* halves = static_cast<const in_memory<std::uint16_t>*>(lanes);
    if constexpr (L::count == 1) {
      number_[0] = widen(halves[0]);
      return;
    }
#if defined __F16C__
    // A load of part of what has just been stored whole would wait for the store: so it is whole too.
    for (int i = 0; i < L::count; i += 16) {
      const __m256i sixteen = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(halves + i));
      _mm256_store_ps(number_ + i, _mm256_cvtph_ps(_mm256_castsi256_si128(sixteen)));
      _mm256_store_ps(number_ + i + 8, _mm256_cvtph_ps(_mm256_extracti128_si256(sixteen, 1)));
    }
#else
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < L::count; ++i) number_[i] = widen(halves[i]);
#endif
  }
  float operator[](int i) const { return number_[i]; }

 private:
  alignas(64) float number_[L::count];
};

// Singles as the lanes of a result. A lane that is left is a NaN.
template <int Count>
inline Left narrow(const float* numbers, std::uint16_t* halves) {
  if constexpr (Count == 1) {
    Left left = 0;
    halves[0] = static_cast<std::uint16_t>(narrow(numbers[0], left));
    return left;
  }
#if defined __F16C__
  // Stored in pieces as wide as those that are loaded next. NaNs are told by their bits: a comparison of numbers may be
  // moved behind the end of what HostFpu guards.
  const __m256i infinity = _mm256_set1_epi32(Single::infinity), magnitude = _mm256_set1_epi32(single_magnitude);
  __m256i nans = _mm256_setzero_si256();
  const auto eight = [&](int i) {
    const __m256 x = _mm256_load_ps(numbers + i);
    const __m256i bits = _mm256_castps_si256(x);
    nans = _mm256_or_si256(nans, _mm256_sub_epi32(infinity, _mm256_and_si256(bits, magnitude)));
    return _mm256_cvtps_ph(x, _MM_FROUND_CUR_DIRECTION);
  };
  for (int i = 0; i < Count; i += 16)
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(halves + i), _mm256_set_m128i(eight(i + 8), eight(i)));
  return mask_not_zero(static_cast<word>(_mm256_movemask_ps(_mm256_castsi256_ps(nans))));
#else
  // Words first: the compiler would pack each term of the last sum by itself.
  alignas(64) word words[Count];
  Left left = 0;
  KASTARRI_LANES_INDEPENDENT
  for (int i = 0; i < Count; ++i) words[i] = narrow(numbers[i], left);
  KASTARRI_LANES_INDEPENDENT
  for (int i = 0; i < Count; ++i) halves[i] = static_cast<std::uint16_t>(words[i]);
  return left;
#endif
}

struct HostResult {
  word flags;
  bool some_left;
};

// Result lane i = rule(operand lanes i ...) on the unit, a float; for a result of integers,
// rule(left, operand lanes i ...). The results are apart from the operands.
template <class R, class... Ls, class Rule, class... Units>
inline HostResult on_host(Rounding rounding, typename R::container* results, Rule rule, const Units*... operands) {
  HostFpu fpu(rounding, results, operands...);
  Left left = 0;
  const auto every_lane = [=, &left](const auto&... x) {
    if constexpr (std::is_same_v<typename R::number, half_float>) {
      alignas(64) float numbers[R::count];
      KASTARRI_LANES_INDEPENDENT
      for (int i = 0; i < R::count; ++i) numbers[i] = rule(x[i]...);
      left = narrow<R::count>(numbers, results);
    } else if constexpr (std::is_same_v<typename R::number, single_float>) {
      KASTARRI_LANES_INDEPENDENT
      for (int i = 0; i < R::count; ++i) {
        results[i] = bits_of(rule(x[i]...));
        left |= left_above(results[i] & single_magnitude, Single::infinity);
      }
    } else {
      KASTARRI_LANES_INDEPENDENT
      for (int i = 0; i < R::count; ++i) results[i] = static_cast<typename R::container>(rule(left, x[i]...));
    }
  };
  every_lane(HostOperand<Ls>(operands)...);
  return {fpu.leave(), some_left(left)};
}

}  // namespace

#endif
