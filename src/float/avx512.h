// The AVX-512 unit, whose instructions carry their rounding and raise no flags: the control word, the writing of
// which costs as much as a whole vector does, is left alone unless the host flushes subnormals.
//
// A result is inexact when rounding up and rounding down disagree on it. So every vector is computed both
// ways, and once more to nearest; toward zero is the lesser of the two. The host's flush-to-zero and
// denormals-are-zero bits alone still count; with_subnormals sees to them.
#ifndef KASTARRI_FLOAT_AVX512_H
#define KASTARRI_FLOAT_AVX512_H

#ifdef __AVX512F__

// g++ takes what its own header leaves undefined on purpose for a mistake.
#ifndef __clang__
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wuninitialized"
#pragma GCC diagnostic ignored "-Wmaybe-uninitialized"
#endif
#include <immintrin.h>
#ifndef __clang__
#pragma GCC diagnostic pop
#endif

#include "float/bits.h"

namespace {

template <Rounding R>
constexpr int in_instruction = _MM_FROUND_NO_EXC | (R == to_nearest    ? _MM_FROUND_TO_NEAREST_INT
                                                    : R == toward_zero ? _MM_FROUND_TO_ZERO
                                                    : R == upward      ? _MM_FROUND_TO_POS_INF
                                                                       : _MM_FROUND_TO_NEG_INF);

// The mask of masked forms that leave nothing out. The plain ones have the compiler warn of its own header.
inline __mmask16 sixteen_lanes() { return 0xFFFF; }

// Where numbers differ. The compiler's own function of this instruction may raise flags: clang makes of a comparison
// that raises none one that does.
inline __mmask16 differing(__m512 a, __m512 b) {
  __mmask16 differ;
  asm("vcmpneqps %{sae%}, %2, %1, %0" : "=k"(differ) : "v"(a), "v"(b));
  return differ;
}

// Sixteen singles, with arithmetic that rounds by R.
template <Rounding R>
struct Sixteen {
  __m512 v;
  friend Sixteen operator+(Sixteen a, Sixteen b) { return {_mm512_add_round_ps(a.v, b.v, in_instruction<R>)}; }
  friend Sixteen operator-(Sixteen a, Sixteen b) { return {_mm512_sub_round_ps(a.v, b.v, in_instruction<R>)}; }
  friend Sixteen operator*(Sixteen a, Sixteen b) { return {_mm512_mul_round_ps(a.v, b.v, in_instruction<R>)}; }
  friend Sixteen operator*(Sixteen a, float b) { return a * Sixteen{_mm512_set1_ps(b)}; }
  friend Sixteen operator-(Sixteen a) { return {_mm512_xor_ps(a.v, _mm512_set1_ps(-0.0f))}; }
};

template <class F, Rounding R>
inline Sixteen<R> sum(Sixteen<R> a, Sixteen<R> b) {
  return a + b;
}
template <class F, Rounding R>
inline Sixteen<R> product(Sixteen<R> a, Sixteen<R> b) {
  return a * b;
}

template <class F, Rounding R>
inline Sixteen<R> fused(Sixteen<R> acc, Sixteen<R> a, Sixteen<R> b) {
  return {_mm512_fmadd_round_ps(a.v, b.v, acc.v, in_instruction<R>)};
}

inline __m512 integral_away(__m512 x) {
  const __m512 absolute = _mm512_andnot_ps(_mm512_set1_ps(-0.0f), x);
  const __m512 cut =
      _mm512_maskz_roundscale_round_ps(sixteen_lanes(), absolute, in_instruction<toward_zero>, _MM_FROUND_NO_EXC);
  const __m512 cut_off = _mm512_sub_round_ps(absolute, cut, in_instruction<to_nearest>);
  // What is cut off is at least 0, or a NaN.
  const __mmask16 up = _mm512_cmpge_epi32_mask(_mm512_castps_si512(cut_off), _mm512_castps_si512(_mm512_set1_ps(0.5f)));
  const __m512 rounded = _mm512_mask_add_round_ps(cut, up, cut, _mm512_set1_ps(1), in_instruction<to_nearest>);
  return _mm512_or_ps(rounded, _mm512_and_ps(_mm512_set1_ps(-0.0f), x));
}

template <Rounding R>
inline Sixteen<R> integral(const TiesAway&, Sixteen<R> x) {
  return {integral_away(x.v)};
}
template <Rounding R>
inline Sixteen<R> integral(Rounding, Sixteen<R> x) {
  return {_mm512_maskz_roundscale_round_ps(sixteen_lanes(), x.v, in_instruction<R>, _MM_FROUND_NO_EXC)};
}

// --- Lanes ------------------------------------------------------------------------------------------

// A load of part of what has just been stored whole would wait for the store: so it is whole too.
template <class L>
inline __m256i half_register(const typename L::container* lanes, int from) {
  if constexpr (L::count == 16) return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(lanes));
  const __m512i all = _mm512_loadu_si512(lanes);
  return from == 0 ? _mm512_castsi512_si256(all) : _mm512_maskz_extracti64x4_epi64(0xF, all, 1);
}

// Sixteen lanes of layout L from number `from` on, as singles; a lane alone sixteen times.
template <class L, Rounding R>
inline Sixteen<R> load_sixteen(const typename L::container* lanes, int from) {
  constexpr bool is_signed = std::is_signed_v<typename L::container>;
  if constexpr (std::is_same_v<typename L::number, half_float>) {
    return {_mm512_maskz_cvt_roundph_ps(sixteen_lanes(), half_register<L>(lanes, from), _MM_FROUND_NO_EXC)};
  } else if constexpr (std::is_same_v<typename L::number, single_float>) {
    return {
        _mm512_castsi512_ps(L::count == 1 ? _mm512_set1_epi32(static_cast<int>(*lanes)) : _mm512_loadu_si512(lanes))};
  } else if constexpr (L::bits == 32) {
    const __m512i integers = _mm512_loadu_si512(lanes);
    if constexpr (is_signed) return {_mm512_maskz_cvt_roundepi32_ps(sixteen_lanes(), integers, in_instruction<R>)};
    return {_mm512_maskz_cvt_roundepu32_ps(sixteen_lanes(), integers, in_instruction<R>)};
  } else {
    const __m256i integers = half_register<L>(lanes, from);
    const __m512i wide = is_signed ? _mm512_maskz_cvtepi16_epi32(sixteen_lanes(), integers)
                                   : _mm512_maskz_cvtepu16_epi32(sixteen_lanes(), integers);
    return {_mm512_maskz_cvt_roundepi32_ps(sixteen_lanes(), wide, in_instruction<R>)};
  }
}

template <Rounding R>
inline Sixteen<R> exact_single_of(Sixteen<R> converted) {
  return converted;
}
template <Rounding R>
inline Sixteen<R> scaled_single(Sixteen<R> converted, float unit) {
  return converted * unit;
}

// The compiler's own function of this instruction lets it raise flags.
template <Rounding R>
inline __m256i halves_of(Sixteen<R> x) {
  __m256i halves;
  asm("vcvtps2ph %2, %{sae%}, %1, %0" : "=v"(halves) : "v"(x.v), "i"(in_instruction<R> & 3));
  return halves;
}

// A register of results of layout L, rounded by R.
template <class L, Rounding R, class... Ls, class Mode, class Rule, class... Units>
inline __m512i rounded(const Mode& mode, Rule rule, const Units*... operands) {
  const auto sixteen = [&](int from) {
    return by_rule(rule, mode, load_sixteen<Ls, R>(reinterpret_cast<const typename Ls::container*>(operands), from)...);
  };
  if constexpr (L::bits == 32) {
    return _mm512_castps_si512(sixteen(0).v);
  } else {
    const __m512i low = _mm512_zextsi256_si512(halves_of(sixteen(0)));
    return L::count == 32 ? _mm512_inserti64x4(low, halves_of(sixteen(16)), 1) : low;
  }
}

// --- A whole vector -----------------------------------------------------------------------------------

constexpr word flushing = 0x8040;  // flush-to-zero and denormals-are-zero

// What compute() returns, subnormals being neither read nor written as zeros. A function of its own, so that compilers
// cannot move arithmetic past the writes (see HostFpu): operands come from memory that is unknown before the one, and
// results, with what is told of them, have to be in memory before the other.
template <class Compute>
[[gnu::noinline, gnu::cold]] HostResult honouring_subnormals(const Compute& compute, word found) {
  const word honest = found & ~flushing;
  asm volatile("ldmxcsr %0" : : "m"(honest) : "memory");
  HostResult result = compute();
  asm volatile("" : "+m"(result) : : "memory");
  asm volatile("ldmxcsr %0" : : "m"(found) : "memory");
  return result;
}

template <class Compute>
inline HostResult with_subnormals(const Compute& compute) {
  word found;
  asm volatile("stmxcsr %0" : "=m"(found));
  return __builtin_expect(found & flushing, 0) ? honouring_subnormals(compute, found) : compute();
}

// Lanes of 16 or 32 bits compared, and chosen: b `where` a bit is 1.
template <int Bits>
struct LaneTests;
template <>
struct LaneTests<16> {
  static __m512i all(word x) { return _mm512_set1_epi16(static_cast<short>(x)); }
  static std::uint32_t differ(__m512i a, __m512i b) { return _mm512_cmpneq_epu16_mask(a, b); }
  static std::uint32_t above(__m512i a, __m512i b) { return _mm512_cmpgt_epu16_mask(a, b); }
  static __m512i chosen(__m512i a, std::uint32_t where, __m512i b) { return _mm512_mask_mov_epi16(a, where, b); }
  static __m512i greater(__m512i a, __m512i b) { return _mm512_max_epu16(a, b); }
};
template <>
struct LaneTests<32> {
  static __m512i all(word x) { return _mm512_set1_epi32(static_cast<int>(x)); }
  static std::uint32_t differ(__m512i a, __m512i b) { return _mm512_cmpneq_epu32_mask(a, b); }
  static std::uint32_t above(__m512i a, __m512i b) { return _mm512_cmpgt_epu32_mask(a, b); }
  static __m512i chosen(__m512i a, std::uint32_t where, __m512i b) {
    return _mm512_mask_mov_epi32(a, static_cast<__mmask16>(where), b);
  }
  static __m512i greater(__m512i a, __m512i b) { return _mm512_maskz_max_epu32(sixteen_lanes(), a, b); }
};

template <class L>
inline void store_lanes(typename L::container* results, __m512i lanes) {
  if constexpr (L::count == 1) {
    *results = static_cast<typename L::container>(_mm_cvtsi128_si32(_mm512_castsi512_si128(lanes)));
  } else if constexpr (L::count * L::bits == 256) {
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(results), _mm512_castsi512_si256(lanes));
  } else {
    _mm512_storeu_si512(results, lanes);
  }
}

// --- Halves -------------------------------------------------------------------------------------------

// Sixteen results in single precision, to be rounded by R to halves: rounded to odd first, so that rounding again is
// rounding once. Odd is truncated, and the last bit set where that is inexact.
template <Rounding R, class... Ls, class Rule, class... Units>
inline __m512 odd(Rule rule, int from, const Units*... operands) {
  const auto rounded_by = [&](auto... x) { return rule(x...).v; };
  const __m512 up = rounded_by(load_sixteen<Ls, upward>(operands, from)...);
  const __m512 down = rounded_by(load_sixteen<Ls, downward>(operands, from)...);
  const __m512i zeroward = _mm512_castps_si512(rounded_by(load_sixteen<Ls, toward_zero>(operands, from)...));
  const __m512i exact = R == downward ? _mm512_castps_si512(down) : zeroward;  // which differ where they are 0
  return _mm512_castsi512_ps(_mm512_mask_or_epi32(exact, differing(up, down), zeroward, _mm512_set1_epi32(1)));
}

// Lanes that overflow, and tiny ones that are inexact, are left.
template <Rounding R, class L, class... Ls, class Rule, class... Units>
[[gnu::flatten]] inline HostResult halves_by_instruction(typename L::container* results, Rule rule,
                                                         const Units*... operands) {
  std::uint32_t all_left = 0, all_inexact = 0;
  const auto sixteen = [&](int from) {
    const __m512 x = odd<R, Ls...>(rule, from, reinterpret_cast<const typename Ls::container*>(operands)...);
    const __m256i halves = halves_of(Sixteen<R>{x});
    const __m512i bits = _mm512_castps_si512(x);
    const __m512i magnitude = _mm512_and_si512(bits, _mm512_set1_epi32(single_magnitude));
    const __mmask16 inexact = _mm512_cmpneq_epi32_mask(
        bits, _mm512_castps_si512(_mm512_maskz_cvt_roundph_ps(sixteen_lanes(), halves, _MM_FROUND_NO_EXC)));
    const __mmask16 tiny =
        _mm512_mask_cmplt_epi32_mask(inexact, magnitude, _mm512_set1_epi32(single_bits_of_power(Half::least_exponent)));
    const __mmask16 left = tiny | _mm512_cmpgt_epi32_mask(magnitude, _mm512_set1_epi32(widened_largest<Half>));
    all_left |= left;
    all_inexact |= inexact & ~left;
    // A branch, so that the halves need not wait for what tells whether they are left.
    return __builtin_expect(left != 0, 0) ? _mm256_mask_mov_epi16(halves, left, _mm256_set1_epi32(-1)) : halves;
  };
  __m512i halves = _mm512_zextsi256_si512(sixteen(0));
  if constexpr (L::count == 32) halves = _mm512_inserti64x4(halves, sixteen(16), 1);
  store_lanes<L>(results, halves);
  return {all_inexact != 0 ? word{inexact} : 0, all_left != 0};
}

template <class L, class... Ls, class Rule, class... Units>
inline HostResult halves_by_instruction(Rounding rounding, typename L::container* results, Rule rule,
                                        const Units*... operands) {
  switch (rounding) {
    case upward:
      return halves_by_instruction<upward, L, Ls...>(results, rule, operands...);
    case downward:
      return halves_by_instruction<downward, L, Ls...>(results, rule, operands...);
    case toward_zero:
      return halves_by_instruction<toward_zero, L, Ls...>(results, rule, operands...);
    default:
      return halves_by_instruction<to_nearest, L, Ls...>(results, rule, operands...);
  }
}

// --- All ----------------------------------------------------------------------------------------------

constexpr Rounding rounding_of(Rounding rounding) { return rounding; }
constexpr Rounding rounding_of(TiesAway) { return toward_zero; }

// Result lane i = rule(operand lanes i ...), as on_host. Lanes that overflow, or whose inexact result may be
// tiny, are left.
template <class L, class... Ls, class Mode, class Rule, class... Units>
inline HostResult by_instruction(const Mode& mode, typename L::container* results, Rule rule,
                                 const Units*... operands) {
  using F = format_of<L>;
  using Tests = LaneTests<L::bits>;
  const Rounding rounding = rounding_of(mode);
  const __m512i up = rounded<L, upward, Ls...>(mode, rule, operands...);
  const __m512i down = rounded<L, downward, Ls...>(mode, rule, operands...);
  const __m512i magnitude_mask = Tests::all(F::sign - 1);
  const __m512i up_magnitude = _mm512_and_si512(up, magnitude_mask);
  const __m512i down_magnitude = _mm512_and_si512(down, magnitude_mask);
  const __m512i greater = Tests::greater(up_magnitude, down_magnitude);
  const std::uint32_t differ = Tests::differ(up_magnitude, down_magnitude);
  const std::uint32_t left =
      Tests::above(greater, Tests::all(F::largest)) | (differ & ~Tests::above(greater, Tests::all(F::unit)));
  const __m512i result = rounding == to_nearest ? rounded<L, to_nearest, Ls...>(mode, rule, operands...)
                         : rounding == upward   ? up
                         : rounding == downward ? down
                                                : Tests::chosen(up, Tests::above(up_magnitude, down_magnitude), down);
  store_lanes<L>(results, Tests::chosen(result, left, _mm512_set1_epi32(-1)));
  return {(differ & ~left) != 0 ? word{inexact} : 0, left != 0};
}

// Numbers times a power of two, truncated to integers of layout L. Lanes that have no such integer are left.
template <class L, class From, class Units>
inline HostResult truncated_by_instruction(typename L::container* results, word scale, const Units* operand) {
  constexpr bool is_signed = std::is_signed_v<typename L::container>;
  const float power = as_float(single_bits_of_power(static_cast<int>(scale)));
  std::uint32_t left = 0, fractions = 0;
  const auto sixteen = [&](int from) {
    const __m512 x =
        (load_sixteen<From, toward_zero>(reinterpret_cast<const typename From::container*>(operand), from) * power).v;
    constexpr bool whole_word = L::bits == 32 && !is_signed;
    const __m512i integers = whole_word ? _mm512_maskz_cvtt_roundps_epu32(sixteen_lanes(), x, _MM_FROUND_NO_EXC)
                                        : _mm512_maskz_cvtt_roundps_epi32(sixteen_lanes(), x, _MM_FROUND_NO_EXC);
    const __m512 back = whole_word
                            ? _mm512_maskz_cvt_roundepu32_ps(sixteen_lanes(), integers, in_instruction<toward_zero>)
                            : _mm512_maskz_cvt_roundepi32_ps(sixteen_lanes(), integers, in_instruction<toward_zero>);
    // What does not fit becomes 2^32 - 1 without a sign, which no single is, or the least integer.
    __m512i fitting = integers;
    if constexpr (L::bits == 16)
      fitting = is_signed ? _mm512_maskz_cvtepi16_epi32(sixteen_lanes(),
                                                        _mm512_maskz_cvtepi32_epi16(sixteen_lanes(), integers))
                          : _mm512_and_si512(integers, _mm512_set1_epi32(0xFFFF));
    const __mmask16 unfit = L::bits == 16
                                ? _mm512_cmpneq_epu32_mask(integers, fitting)
                                : _mm512_cmpeq_epu32_mask(integers, _mm512_set1_epi32(whole_word ? -1 : INT32_MIN));
    left |= unfit;
    fractions |= ~unfit & differing(x, back);
    return integers;
  };
  __m512i integers = sixteen(0);
  if constexpr (L::bits == 16)
    integers = _mm512_inserti64x4(_mm512_zextsi256_si512(_mm512_maskz_cvtepi32_epi16(sixteen_lanes(), integers)),
                                  _mm512_maskz_cvtepi32_epi16(sixteen_lanes(), sixteen(16)), 1);
  store_lanes<L>(results, integers);
  return {fractions != 0 ? word{inexact} : 0, left != 0};
}

}  // namespace

#endif

#endif
