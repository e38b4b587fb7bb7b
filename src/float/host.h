// The host's floating-point unit as a fast path for whole vectors.
//
// Its control word (MXCSR) is the host program's: rounding, and flags that have to be found as they were left.
// To write it, or to read flags that have just been raised, costs more than a whole vector does. So the unit
// computes exactly, in a format with room enough: then no rounding mode counts and no flag is raised. The
// rounding is done afterwards, on the bits of the result (rounded_off), and what it drops tells whether it is inexact.
//
//   halves    are computed as singles, 24 bits, in which every half is a number and the product of two exact;
//   singles   as doubles, 53 bits, in which the product of two is exact;
//   sums      of numbers too far apart for that have the lesser one replaced (apart).
//
// Lanes for which this does not hold are left to the reference: operands or results that are infinite or
// NaNs, results that overflow or come near, tiny ones that need not be exact. They, and subnormal operands, raise
// the host's flags, so HostFpu puts these back.
#ifndef KASTARRI_FLOAT_HOST_H
#define KASTARRI_FLOAT_HOST_H

#include <immintrin.h>

#include <cstdint>
#include <cstring>

#include "float/formats.h"
#include "frame/lanes.h"
#include "frame/scale.h"

namespace {

// What the pointer leads to is unknown before, and memory may be read after.
template <class Pointer>
inline void pin(Pointer& pointer) {
  asm volatile("" : "+r"(pointer) : : "memory");
}

// While it lives, subnormals are honoured, every exception is masked, and sums of 0 are +0. Afterwards MXCSR is as
// it was before. It is written only where it differs.
// Compilers know nothing of MXCSR and move arithmetic past its writes; they cannot where operands are read through
// pointers, and results written through them, that pass here as outputs of an assembler statement between the
// writes: what a load yields is unknown before the one write, and a store must be done before the other, which may
// read any memory.
class HostFpu {
 public:
  template <class... Pointers>
  explicit HostFpu(Pointers&... operands_and_results) : found_(read()) {
    if (__builtin_expect((found_ & ~flags) != all_masked, 0)) write(all_masked);
    (pin(operands_and_results), ...);
  }
  ~HostFpu() {
    if (__builtin_expect(read() != found_, 0)) write(found_);
  }
  HostFpu(const HostFpu&) = delete;
  HostFpu& operator=(const HostFpu&) = delete;

 private:
  static constexpr word all_masked = 0x1F80, flags = 0x3F;

  static word read() {
    word mxcsr;
    asm volatile("stmxcsr %0" : "=m"(mxcsr) : : "memory");
    return mxcsr;
  }
  static void write(word mxcsr) { asm volatile("ldmxcsr %0" : : "m"(mxcsr) : "memory"); }

  const word found_;
};

template <class To, class From>
inline To same_bits_as(From from) {
  static_assert(sizeof(To) == sizeof(From));
  To to;
  std::memcpy(&to, &from, sizeof to);
  return to;
}
inline float as_float(word bits) { return same_bits_as<float>(bits); }
inline double as_float(std::uint64_t bits) { return same_bits_as<double>(bits); }
inline word bits_of(float x) { return same_bits_as<word>(x); }
inline std::uint64_t bits_of(double x) { return same_bits_as<std::uint64_t>(x); }

// Rules for whole vectors choose between values by masks made of signs. Of a comparison the compiler
// makes a branch when that spares it a floating-point operation, and does not vectorise the branch.
template <class T>
constexpr T sign_mask(T x) {
  return static_cast<T>(static_cast<std::make_signed_t<T>>(x) >> (8 * sizeof(T) - 1));
}
// All ones where x < y, as signed numbers whose difference is one; where x, below the top bit, is not 0.
template <class T>
constexpr T mask_below(T x, T y) {
  return sign_mask(static_cast<T>(x - y));
}
template <class T>
constexpr T mask_not_zero(T x) {
  return sign_mask(static_cast<T>(0 - x));
}
template <class T>
constexpr T chosen(T mask, T where_set, T elsewhere) {
  return (mask & where_set) | (~mask & elsewhere);
}

constexpr word single_sign = Single::sign;
constexpr word single_magnitude = Single::sign - 1;
constexpr std::uint64_t double_sign = std::uint64_t{1} << 63;
constexpr std::uint64_t double_magnitude = double_sign - 1;
constexpr int double_fraction_bits = 52;

constexpr word single_bits_of_power(int exponent) {
  return static_cast<word>(exponent + Single::bias) << Single::fraction_bits;
}

// What a loop learns about its lanes: bit 31 of `left` is set when one is left to the reference, a bit of `lost` when
// a result is inexact.
struct Seen {
  word left = 0;
  word lost = 0;
  std::uint64_t lost_from_doubles = 0;
};
// All magnitudes are below 2^31, so a difference of two has its sign in bit 31.
constexpr word left_above(word magnitude, word bound) { return bound - magnitude; }

// --- Rounding -----------------------------------------------------------------------------------------

// What is added to the bits of a number before the lowest are dropped, so that it is rounded: bits of a
// number, a carry from its fraction included, count as an integer does.
struct ToNearest {
  template <int Count, class Bits>
  static constexpr Bits increment(Bits bits) {
    return (Bits{1} << (Count - 1)) - 1 + (bits >> Count & 1);
  }
  // Bits of a sum, which is +0 when it is 0 but for signs that agree.
  static constexpr word sum_bits(word bits, word) { return bits; }
};

struct TiesAway {
  template <int Count, class Bits>
  static constexpr Bits increment(Bits) {
    return Bits{1} << (Count - 1);
  }
};

struct Directed {
  explicit Directed(Rounding rounding)
      : away(rounding == toward_zero ? 0 : ~std::uint64_t{0}),
        up(rounding == upward ? ~std::uint64_t{0} : 0),
        sign_of_zero(rounding == downward ? single_sign : 0) {}
  template <int Count, class Bits>
  constexpr Bits increment(Bits bits) const {
    return (sign_mask(bits) ^ static_cast<Bits>(up)) & static_cast<Bits>(away) & ((Bits{1} << Count) - 1);
  }
  word sum_bits(word bits, word either_sign) const {
    return bits | (either_sign & sign_of_zero & ~mask_not_zero(bits & single_magnitude));
  }

  std::uint64_t away, up;
  word sign_of_zero;
};

template <class Bits>
struct Dropped {
  Bits kept, dropped;
};
template <int Count, class Bits, class Mode>
inline Dropped<Bits> rounded_off(Bits bits, const Mode& mode) {
  constexpr Bits low = (Bits{1} << Count) - 1;
  return {(bits + mode.template increment<Count>(bits)) & ~low, bits & low};
}

// --- Exact arithmetic: format of the operands -----------------------------------------------------------

// The exact result, or another number that rounds as it does.
template <class Wide>
struct Exact {
  Wide value;
  word left;             // bit 31 is set where it is neither: the lane is left
  word exact_when_tiny;  // all ones where a result below the normal numbers is not left, since it is exact
  word either_sign;      // of a sum: the signs of both, where the bits of value do not tell it when it is 0
};
constexpr word always = ~word{0};

// The bits of x, but where x is not 0 and lies more than Gap powers of two below y, a number that lies Gap below.
// Beside y it counts no more than any other: sums with y round alike as long as they keep less than Gap bits. Of
// numbers no farther apart the sum has room in a format of Gap bits more than x has.
template <class F, int Gap>
inline typename F::lane apart(typename F::lane x, typename F::lane y) {
  using Signed = std::make_signed_t<typename F::lane>;
  const auto magnitude = static_cast<Signed>(x & (F::sign - 1));
  const auto least = static_cast<Signed>((y & F::infinity) - (word{Gap} << F::fraction_bits));
  const Signed lifted = magnitude < least ? least : magnitude;
  return static_cast<typename F::lane>((x & F::sign) | static_cast<word>(magnitude == 0 ? Signed{0} : lifted));
}
template <int Gap>
inline float apart(float x, float y) {
  return as_float(apart<Single, Gap>(bits_of(x), bits_of(y)));
}

// Halves whose sum has room in a single. (That of a power of two and the lesser one, where they differ in sign, may
// become a tie, between that power and the number below it; it goes to the power, which is right.)
template <class L>
struct ApartHalves {
  ApartHalves(const void* a_lanes, const void* b_lanes) {
    const Read<L> x(a_lanes), y(b_lanes);
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < L::count; ++i) {
      a[i] = apart<Half, 12>(x[i], y[i]);
      b[i] = apart<Half, 12>(y[i], x[i]);
    }
  }
  alignas(64) std::uint16_t a[L::count], b[L::count];
};

template <class F>
inline auto sum(float a, float b) {
  const word either_sign = (bits_of(a) | bits_of(b)) & single_sign;
  if constexpr (std::is_same_v<F, Half>) {
    return Exact<float>{a + b, 0, always, either_sign};  // of ApartHalves
  } else {
    return Exact<double>{double{apart<28>(a, b)} + double{apart<28>(b, a)}, 0, always, either_sign};
  }
}

inline word mask_zero(float x) { return ~mask_not_zero(bits_of(x) & single_magnitude); }

template <class F>
inline auto product(float a, float b) {
  if constexpr (std::is_same_v<F, Half>) {
    return Exact<float>{a * b, 0, 0, 0};
  } else {
    return Exact<double>{double{a} * double{b}, 0, mask_zero(a) | mask_zero(b), 0};
  }
}

// c + p for the product p of two singles, 48 bits, which has room unless it is the greater by 2^28. Where c is the
// greater by 2^3, of p counts what a single holds and whether there is more, which the last bit says: it lies below all
// that decides how the sum, half of c at the least, is rounded. Where c is the greater by 2^28 not even that counts.
inline double sum_with_product(double c, double p) {
  constexpr std::uint64_t power = std::uint64_t{1} << double_fraction_bits, cut_off = (std::uint64_t{1} << 29) - 1;
  const std::uint64_t c_magnitude = bits_of(c) & double_magnitude, p_magnitude = bits_of(p) & double_magnitude;
  const std::uint64_t odd = (p_magnitude | ((p_magnitude & cut_off) + cut_off)) & ~cut_off;
  const std::uint64_t least = (c_magnitude & ~(power - 1)) - 28 * power;
  const std::uint64_t lifted = chosen(sign_mask(odd - least), least, odd) & mask_not_zero(p_magnitude);
  const std::uint64_t kept = chosen(sign_mask(p_magnitude + 3 * power - c_magnitude), lifted, p_magnitude);
  return c + as_float(kept | (bits_of(p) & double_sign));
}

// In bit 31: whether a * b is greater than c by 2^27, if not 0, as exponents tell with fractions for their logarithms,
// which exceed them by less than 0.1. (A subnormal c counts as nearly 2^-126, whose last bit is no higher than its
// own.)
inline word product_far_above(float a, float b, float c) {
  const auto magnitude = [](float x) { return bits_of(x) & single_magnitude; };
  const word bound = magnitude(c) + (Single::one + (word{27} << Single::fraction_bits));
  return bound - (magnitude(a) + magnitude(b));
}

template <class F>
inline auto fused(float acc, float a, float b) {
  const word either_sign = ((bits_of(a) ^ bits_of(b)) | bits_of(acc)) & single_sign;
  if constexpr (std::is_same_v<F, Half>) {
    const float p = a * b;
    return Exact<double>{double{apart<30>(p, acc)} + double{apart<30>(acc, p)}, 0, 0, either_sign};
  } else {
    const word product_zero = mask_zero(a) | mask_zero(b);
    const word left = product_far_above(a, b, acc) & ~product_zero & ~mask_zero(acc);
    return Exact<double>{sum_with_product(acc, double{a} * double{b}), left, product_zero, either_sign};
  }
}

// --- Integers -----------------------------------------------------------------------------------------

// An integer divided by a power of two.
template <class T>
inline auto scaled_single(T integer, float unit) {
  using Wide = std::conditional_t<sizeof(T) == 4, double, float>;
  return Exact<Wide>{static_cast<Wide>(integer) * Wide{unit}, 0, always, 0};
}

// A number as it is.
inline Exact<float> exact_single_of(float x) { return {x, 0, 0, 0}; }

// The exponent of a number is `Single::bias` less than this.
constexpr word biased_exponent(word magnitude) { return magnitude >> Single::fraction_bits; }
// With the hidden bit; 0 for zero. Of subnormals too, which are too small to tell from other small numbers here.
constexpr word significand(word magnitude) {
  return (magnitude & (Single::unit - 1)) | (mask_not_zero(magnitude) & Single::unit);
}
constexpr word at_most(word x, word bound) { return chosen(mask_below(x, bound), x, bound); }

// x * 2^scale truncated to an integer of To. Out of range, or a NaN, it is left.
template <class To>
inline word truncated(float x, word scale, Seen& seen) {
  constexpr bool is_signed = std::is_signed_v<typename To::container>;
  constexpr bool fills_word = !is_signed && To::bits == 32;
  const word magnitude = bits_of(x) & single_magnitude, negative = sign_mask(bits_of(x));
  // |x| * 2^scale is the significand, its first bit the word's, times 2^-right.
  const word right = Single::bias + 31 - biased_exponent(magnitude) - scale, bits = significand(magnitude) << 8;
  const word least = is_signed ? 33 - To::bits : chosen<word>(negative, 32, 32 - To::bits);
  seen.left |= mask_below(right, least);
  const word count = at_most(right, 32);
  const Scaled32 parts(bits, 32 - count);  // but for a count of 0, which it takes for 32
  const word shifted = fills_word ? mask_not_zero(count) : always;
  seen.lost |= shifted & parts.low;
  const word integer = chosen(shifted, parts.high, bits);
  return (integer ^ negative) - negative;
}

struct WholeNumber {
  float value;
  word dropped;
};

// x rounded to an integer; from 2^23 on it is one.
template <class Mode>
inline WholeNumber integral(const Mode& mode, float x) {
  const word magnitude = bits_of(x) & single_magnitude, sign = bits_of(x) & single_sign;
  const word small = mask_below(magnitude, single_bits_of_power(Single::fraction_bits));
  const word right = at_most(Single::bias + Single::fraction_bits - biased_exponent(magnitude), 32);
  const Scaled32 parts(significand(magnitude) & small, 32 - right);
  const auto rounded = rounded_off<32>(std::uint64_t{sign} << 32 | std::uint64_t{parts.high} << 32 | parts.low, mode);
  const auto integer = static_cast<word>(rounded.kept >> 32) & single_magnitude;
  const float number = static_cast<float>(static_cast<std::int32_t>(integer));
  return {as_float(sign | chosen(small, bits_of(number), magnitude)), static_cast<word>(rounded.dropped)};
}

// --- Lanes ------------------------------------------------------------------------------------------

// A half as a single. As the low bits of one it is 2^-112 times itself; only the exponent of infinity
// and NaN has to be told.
inline float widen(word half) {
  const auto spread = static_cast<word>(static_cast<std::int32_t>(half << 16) >> 3);
  const word special = mask_below(word{Half::largest} << 13, spread & 0x0FFFE000) & Single::infinity;
  return as_float((spread & 0x8FFFE000) | special) * 0x1p112f;
}

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

// A lane that is left: a NaN, or what is narrowed to one.
#ifdef __F16C__
template <class F>
constexpr word mark_of_left = ~word{0};
#else
template <class F>
constexpr word mark_of_left = F::bits == 32 ? ~word{0} : (single_bits_of_power(Half::bias + 2) - 1) & ~word{0x1FFF};
#endif
// The largest number of a format, as a single.
template <class F>
constexpr word widened_largest = F::bits == 32 ? Single::largest
                                               : (single_bits_of_power(Half::bias + 1) - 1) & ~word{0x1FFF};

#ifndef __F16C__
// Without the processor's own conversion. Adding 0.5, whose last bit is that of subnormal halves, puts those in place.
inline word narrow(word single) {
  const word magnitude = single & single_magnitude;
  const word small = mask_below(magnitude, single_bits_of_power(Half::least_exponent));
  const word normal = (magnitude >> 13) - (word{Single::bias - Half::bias} << Half::fraction_bits);
  const word subnormal = bits_of(as_float(magnitude & small) + 0.5f) - bits_of(0.5f);
  return chosen(small, subnormal, normal) | (single >> 16 & Half::sign);
}
#endif

template <int Count>
inline void narrow_all(const word* singles, std::uint16_t* halves) {
#ifdef __F16C__
  const auto eight = [singles](int i) {
    return _mm256_cvtps_ph(_mm256_castsi256_ps(_mm256_load_si256(reinterpret_cast<const __m256i*>(singles + i))), 0);
  };
  for (int i = 0; i < Count; i += 16)
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(halves + i), _mm256_set_m128i(eight(i + 8), eight(i)));
#else
  // Words first: the compiler would pack each term of the last sum by itself.
  alignas(64) word words[Count];
  KASTARRI_LANES_INDEPENDENT
  for (int i = 0; i < Count; ++i) words[i] = narrow(singles[i]);
  KASTARRI_LANES_INDEPENDENT
  for (int i = 0; i < Count; ++i) halves[i] = static_cast<std::uint16_t>(words[i]);
#endif
}

// --- Results ------------------------------------------------------------------------------------------

// An exact result rounded to format F, as the bits of a single, or the mark of a lane that is left.
template <class F, class Wide, class Mode>
inline word settled(const Exact<Wide>& x, const Mode& mode, Seen& seen) {
  constexpr int wide_bits = sizeof(Wide) == 8 ? double_fraction_bits : Single::fraction_bits;
  constexpr int excess = wide_bits - F::fraction_bits;
  word bits;
  if constexpr (excess == 0) {
    bits = bits_of(x.value);
  } else {
    const auto rounded = rounded_off<excess>(bits_of(x.value), mode);
    bits = mode.sum_bits(bits_of(static_cast<float>(as_float(rounded.kept))), x.either_sign);
    if constexpr (sizeof(Wide) == 8) seen.lost_from_doubles |= rounded.dropped;
    if constexpr (sizeof(Wide) == 4) seen.lost |= rounded.dropped;
  }
  // Singles are judged before rounding, which may end at 0: of a tiny number, or of a NaN, whose fraction carries.
  const word magnitude = (sizeof(Wide) == 4 ? bits_of(static_cast<float>(x.value)) : bits) & single_magnitude;
  word tiny;
  if constexpr (F::bits == 32) {
    // Up to the least normal number, for what is just below may have been rounded to it.
    tiny = excess == 0 ? 0 : mask_below(magnitude, Single::unit + 1);
  } else {
    tiny = 0 - (magnitude & mask_below(magnitude, single_bits_of_power(Half::least_exponent)));
  }
  const word left = (tiny & ~x.exact_when_tiny) | x.left | left_above(magnitude, widened_largest<F>);
  seen.left |= left;
  return chosen(sign_mask(left), mark_of_left<F>, bits);
}
// A half that is rounded to an integer is a half.
template <class F, class Mode>
inline word settled(const WholeNumber& x, const Mode&, Seen& seen) {
  const word bits = bits_of(x.value);
  const word left = left_above(bits & single_magnitude, widened_largest<F>);
  seen.left |= left;
  seen.lost |= x.dropped;
  return chosen(sign_mask(left), mark_of_left<F>, bits);
}

struct HostResult {
  word flags;
  bool some_left;
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

// Result lane i = rule(operand lanes i ...) on the unit, Exact or WholeNumber; for a result of integers
// rule(seen, operand lanes i ...). The results are apart from the operands. Flattened: a call within a
// loop over lanes would keep it from being vectorised.
template <class R, class... Ls, class Mode, class Rule, class... Units>
[[gnu::flatten]] inline HostResult on_host_in(const Mode& mode, typename R::container* results, Rule rule,
                                              const Units*... operands) {
  Seen seen;
  const auto every_lane = [&](const auto&... x) {
    if constexpr (std::is_same_v<typename R::number, integer>) {
      KASTARRI_LANES_INDEPENDENT
      for (int i = 0; i < R::count; ++i) results[i] = static_cast<typename R::container>(rule(seen, x[i]...));
    } else {
      const auto singles = [&](word* to) {
        KASTARRI_LANES_INDEPENDENT
        for (int i = 0; i < R::count; ++i) to[i] = settled<format_of<R>>(by_rule(rule, mode, x[i]...), mode, seen);
      };
      if constexpr (R::bits == 32) {
        singles(results);
      } else {
        alignas(64) word halves[R::count];
        singles(halves);
        narrow_all<R::count>(halves, results);
      }
    }
  };
  {
    const HostFpu fpu(results, operands...);
    every_lane(HostOperand<Ls>(operands)...);
  }
  return {(seen.lost | seen.lost_from_doubles) != 0 ? word{inexact} : 0, sign_mask(seen.left) != 0};
}

template <class R, class... Ls, class Rule, class... Units>
inline HostResult on_host(TiesAway mode, typename R::container* results, Rule rule, const Units*... operands) {
  return on_host_in<R, Ls...>(mode, results, rule, operands...);
}
template <class R, class... Ls, class Rule, class... Units>
inline HostResult on_host(Rounding rounding, typename R::container* results, Rule rule, const Units*... operands) {
  if (rounding == to_nearest) return on_host_in<R, Ls...>(ToNearest(), results, rule, operands...);
  return on_host_in<R, Ls...>(Directed(rounding), results, rule, operands...);
}

}  // namespace

#endif
