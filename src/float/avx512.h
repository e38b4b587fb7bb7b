// The AVX-512 unit, whose instructions carry their rounding and raise no flags of the host.
//
// A vector is computed as the mode has it. A result is inexact when rounding up and rounding down disagree on it; that
// is looked at until inexact has been raised. Where a result is special the vector is computed with care: lanes that
// are inexact and special (tiny, or great enough for overflow) and NaNs are left to the reference.
//
// Of the host's control word only flush-to-zero and denormals-are-zero count for such instructions. To read it costs as
// much as a vector does. So the unit is tried: whether it adds the least subnormal number to 0 or loses it.
#ifndef KASTARRI_FLOAT_AVX512_H
#define KASTARRI_FLOAT_AVX512_H

#ifdef __AVX512F__

#include "float/avx512_lanes.h"

namespace {

constexpr bool rounds_by_instruction = true;

// --- Results ------------------------------------------------------------------------------------------

// What the unit makes of a vector: a register of results, and a bit a lane for those that are inexact and for those
// that are left to the reference.
struct Computed {
  __m512i lanes;
  std::uint32_t inexact;
  std::uint32_t left;
};

// Words of one or two lanes of the same bits each.
template <int Bits>
inline __m512i every_lane(word x) {
  return _mm512_set1_epi32(static_cast<int>(Bits == 16 ? x * 0x10001 : x));
}

// Those of some lanes of 16 or 32 bits whose numbers, without their signs, are not from `least` to `greatest`.
template <int Bits>
inline std::uint32_t outside(std::uint32_t some, __m512i lanes, word least, word greatest) {
  const __m512i from = every_lane<Bits>(2 * least), range = every_lane<Bits>(2 * (greatest - least));
  if constexpr (Bits == 16)
    return _mm512_mask_cmpgt_epu16_mask(some, _mm512_sub_epi16(_mm512_add_epi16(lanes, lanes), from), range);
  else
    return _mm512_mask_cmpgt_epu32_mask(static_cast<__mmask16>(some),
                                        _mm512_sub_epi32(_mm512_add_epi32(lanes, lanes), from), range);
}
// Those that are special unless they are exact: results that may be due to overflow, or are tiny, and NaNs; of
// integers NaNs alone.
template <class L, bool ToIntegers>
inline std::uint32_t special(std::uint32_t some, __m512i lanes) {
  using F = format_of<L>;
  return ToIntegers ? outside<L::bits>(some, lanes, 0, F::infinity)
                    : outside<L::bits>(some, lanes, F::unit + 1, F::largest - 1);
}

// Lanes of an operand that are 0, and results that are 0 for one of the last two operands is: a term beside another 0
// or a factor, so that they are exact.
inline std::uint32_t zeros(__m256i lanes) { return _mm256_testn_epi16_mask(lanes, _mm256_set1_epi16(0x7FFF)); }
inline std::uint32_t zeros(__m512i lanes) { return _mm512_testn_epi32_mask(lanes, _mm512_set1_epi32(INT32_MAX)); }
template <class L>
inline std::uint32_t zeros(const Parts<L>& lanes) {
  std::uint32_t all = zeros(lanes.part[0]);
  if constexpr (parts_of<L> == 2) all |= zeros(lanes.part[1]) << 16;
  return all;
}
template <class Last>
inline std::uint32_t zeros_of_last_two(const Last& last) {
  return zeros(last);
}
template <class First, class Second, class... Others>
inline std::uint32_t zeros_of_last_two(const First& first, const Second& second, const Others&... others) {
  if constexpr (sizeof...(Others) == 0)
    return zeros(first) | zeros(second);
  else
    return zeros_of_last_two(second, others...);
}

// A bit a lane of layout L.
template <class L, class Unit>
inline std::uint32_t enabled_lanes(const Unit*) {
  return L::count == 1 ? 1 : L::count == 16 ? 0xFFFF : ~std::uint32_t{0};
}
template <class L, class Unit, class PredicateUnit>
inline std::uint32_t enabled_lanes(UnitsUnder<Unit, PredicateUnit, false> out) {
  return enabled_lanes<L>(out.units) & *out.predicate;
}

template <class L, class Unit>
inline void store_lanes(Unit* out, std::uint32_t, __m512i lanes) {
  if constexpr (L::count == 1) {
    Write<L>(out).put(0, static_cast<typename L::container>(_mm_cvtsi128_si32(_mm512_castsi512_si128(lanes))));
  } else if constexpr (L::count * L::bits == 256) {
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(out), _mm512_castsi512_si256(lanes));
  } else {
    _mm512_storeu_si512(out, lanes);
  }
}
template <class L, class Unit, class PredicateUnit>
inline void store_lanes(UnitsUnder<Unit, PredicateUnit, false> out, std::uint32_t enabled, __m512i lanes) {
  if constexpr (L::count == 1) return store_lanes<L>(out.units, enabled, lanes);
  const __m512i old = _mm512_loadu_si512(out.units);
  store_lanes<L>(out.units, enabled,
                 L::bits == 16 ? _mm512_mask_mov_epi16(old, enabled, lanes)
                               : _mm512_mask_mov_epi32(old, static_cast<__mmask16>(enabled), lanes));
}

// Raises the flag of lanes that are not left, and completes those that are, by exact(lane of each operand).
template <class R, class... Ls, class Exact>
inline __m512i completed(const Computed& computed, const Exact& exact, const Parts<Ls>&... operands) {
  using Lane = typename R::container;
  if ((computed.inexact & ~computed.left) != 0) raise_sticky(inexact);
  if (computed.left == 0) return computed.lanes;
  alignas(64) Lane lane[64 / sizeof(Lane)];
  _mm512_store_si512(lane, computed.lanes);
  for (std::uint32_t left = computed.left; left != 0; left &= left - 1) {
    const int i = __builtin_ctz(left);
    lane[i] = static_cast<Lane>(exact(Read<Ls>(operands.part)[i]...));
  }
  return _mm512_load_si512(lane);
}

// --- By a rule ----------------------------------------------------------------------------------------

// Part number k of the results, rounded by R.
template <Rounding R, class... Ls, class Mode, class Rule>
inline Sixteen<R> rounded(const Mode& mode, const Rule& rule, int k, const Parts<Ls>&... operands) {
  return by_rule(rule, mode, singles_of<Ls, R>(operands.part[k])...);
}

// Sixteen numbers as singles, rounded up and down.
struct Bounds {
  __m512 up;
  __m512 down;
};
template <class... Ls, class Mode, class Rule>
inline Bounds bounds(const Mode& mode, const Rule& rule, int k, const Parts<Ls>&... operands) {
  return {rounded<upward>(mode, rule, k, operands...).v, rounded<downward>(mode, rule, k, operands...).v};
}

// Rounded to odd: toward zero, and to the neighbour with an odd last bit where that is inexact. (Bounds of one sign are
// in order without it; sums of 0 are +0.)
inline __m512 rounded_to_odd(const Bounds& x) {
  const __m512i toward =
      _mm512_maskz_min_epu32(sixteen_lanes(), _mm512_castps_si512(x.up), _mm512_castps_si512(x.down));
  return _mm512_castsi512_ps(_mm512_mask_or_epi32(toward, differing(x.up, x.down), toward, _mm512_set1_epi32(1)));
}

// Numbers that round to halves as the exact results do. In singles, of 24 bits, products of halves, of 11, are exact,
// and sums rounded to nearest may be rounded again, for 24 >= 2 * 11 + 2; all may in a direction. A fused sum may when
// it is rounded to odd, for 24 >= 11 + 2 (Boldo and Melquiond, "Emulation of FMA and correctly rounded sums: proved
// algorithms using rounding to odd"). That is seldom needed: unless it has been rounded to the middle of two halves,
// the nearest single will do.
template <Rounding R, class... Ls, class Mode, class Rule>
inline Sixteen<R> for_halves(const Mode& mode, const Rule& rule, int k, const Parts<Ls>&... operands) {
  const Sixteen<R> x = rounded<R>(mode, rule, k, operands...);
  if constexpr (R == to_nearest && sizeof...(Ls) > 2) {
    const __m512i dropped = _mm512_and_si512(_mm512_castps_si512(x.v), _mm512_set1_epi32(0x1FFF));
    if (__builtin_expect(_mm512_cmpeq_epi32_mask(dropped, _mm512_set1_epi32(0x1000)) != 0, 0))
      return {rounded_to_odd(bounds(mode, rule, k, operands...))};
  }
  return x;
}

template <class L, Rounding R, class... Ls, class Mode, class Rule>
inline Parts<L> results_by_rule(const Mode& mode, const Rule& rule, const Parts<Ls>&... operands) {
  Parts<L> results;
  for (int k = 0; k < parts_of<L>; ++k) {
    if constexpr (L::bits == 16)
      results.part[k] = halves_of(for_halves<R>(mode, rule, k, operands...));
    else
      results.part[k] = _mm512_castps_si512(rounded<R>(mode, rule, k, operands...).v);
  }
  return results;
}

// Lanes whose results differ from what the rule would yield if nothing were dropped, or are NaNs.
template <bool ToIntegers, class L, class... Ls, class Mode, class Rule>
inline std::uint32_t inexact_lanes(const Mode& mode, const Rule& rule, const Parts<L>& results,
                                   const Parts<Ls>&... operands) {
  std::uint32_t all = 0;
  for (int k = 0; k < parts_of<L>; ++k) {
    const __m512 result = singles_of<L, to_nearest>(results.part[k]).v;
    __mmask16 some;
    if constexpr (ToIntegers) {
      some = (differing(singles_of<Ls, to_nearest>(operands.part[k]).v, result) | ...);
    } else {
      const Bounds x = bounds(mode, rule, k, operands...);
      some = L::bits == 32 ? differing(x.up, x.down)
                           : static_cast<__mmask16>(differing(x.up, result) | differing(x.down, result));
    }
    all |= std::uint32_t{some} << 16 * k;
  }
  return all;
}

// compute(R) for a mode, with the rounding of instructions as a constant.
template <class Compute>
[[gnu::always_inline]] inline auto by_rounding(Rounding rounding, const Compute& compute) {
  if (__builtin_expect(rounding == to_nearest, 1)) return compute(std::integral_constant<Rounding, to_nearest>());
  if (rounding == upward) return compute(std::integral_constant<Rounding, upward>());
  if (rounding == downward) return compute(std::integral_constant<Rounding, downward>());
  return compute(std::integral_constant<Rounding, toward_zero>());
}
template <class Compute>
[[gnu::always_inline]] inline auto by_rounding(TiesAway, const Compute& compute) {
  return compute(std::integral_constant<Rounding, to_nearest>());
}

template <class R, class... Ls, class Mode, class Rule>
[[gnu::always_inline]] inline Parts<R> rounded_by(const Mode& mode, const Rule& rule, const Parts<Ls>&... operands) {
  return by_rounding(
      mode, [&](auto by) __attribute__((always_inline)) {
        return results_by_rule<R, decltype(by)::value>(mode, rule, operands...);
      });
}

// Results as they have been computed, where a lane may be special or the host flushes subnormals.
template <bool ToIntegers, class R, class... Ls, class Mode, class Rule, class Exact>
__m512i completed_with_care(Parts<R> results, Mode mode, bool tells_inexact, std::uint32_t enabled, Rule rule,
                            Exact exact, Parts<Ls>... operands) {
  Computed computed;
  {
    const SubnormalsHonoured honoured;
    (pin(operands), ...);
    if (honoured.were_flushed()) results = rounded_by<R>(mode, rule, operands...);
    computed = {joined(results), inexact_lanes<ToIntegers>(mode, rule, results, operands...) & enabled, 0};
    pin(computed.lanes);
    pin_word(computed.inexact);
  }
  computed.left = special<R, ToIntegers>(computed.inexact, computed.lanes);
  if (!tells_inexact) computed.inexact = 0;
  return completed<R>(computed, exact, operands...);
}
template <class>
using Joined = __m512i;
template <bool ToIntegers, class R, class... Ls, class Mode, class Rule, class Exact>
[[gnu::noinline]] __m512i with_care(__m512i results, Mode mode, bool tells_inexact, std::uint32_t enabled, Rule rule,
                                    Exact exact, Joined<Ls>... operands) {
  return completed_with_care<ToIntegers>(Parts<R>(results), mode, tells_inexact, enabled, rule, exact,
                                         Parts<Ls>(operands)...);
}

template <class L>
using Operand = Sixteen<to_nearest>;
template <class R, class... Ls, class Out, class Mode, class Rule, class Exact, class... Units>
[[gnu::always_inline]] inline void store_by_rule(Out out, Mode mode, bool tells_inexact, Rule rule, Exact exact,
                                                 const Units*... operands) {
  constexpr bool to_integers = std::is_invocable_v<Rule, Mode, Operand<Ls>...>;
  const std::uint32_t enabled = enabled_lanes<R>(out);
  const auto results = [&](const Parts<Ls>&... x) __attribute__((always_inline)) {
    const Parts<R> parts = rounded_by<R>(mode, rule, x...);
    const __m512i lanes = joined(parts);
    std::uint32_t doubtful = special<R, to_integers>(enabled, lanes);
    if (__builtin_expect(doubtful != 0, 0)) doubtful &= ~(zeros(parts) & zeros_of_last_two(x...));
    // What has been raised already need not be found again. In functions for two parts it would take registers.
    const bool wants_inexact = tells_inexact && !is_raised(inexact);
    if (__builtin_expect(doubtful != 0 || flushes_subnormals() || (parts_of<R> == 2 && wants_inexact), 0))
      return with_care<to_integers, R, Ls...>(lanes, mode, tells_inexact, enabled, rule, exact, joined(x)...);
    if (__builtin_expect(wants_inexact, 0) && (inexact_lanes<to_integers>(mode, rule, parts, x...) & enabled) != 0)
      raise_sticky(inexact);
    return lanes;
  };
  store_lanes<R>(out, enabled, results(Parts<Ls>(operands)...));
}

// --- Truncated ----------------------------------------------------------------------------------------

// Numbers times a power of two, truncated to integers of layout L. Lanes that have no such integer are left.
template <class L, class From>
inline Computed truncated(word scale, const Parts<From>& operand) {
  constexpr bool is_signed = std::is_signed_v<typename L::container>, whole_word = L::bits == 32 && !is_signed;
  const float power = as_float(single_bits_of_power(static_cast<int>(scale)));
  Computed computed = {};
  Parts<L> integers;
  for (int k = 0; k < parts_of<L>; ++k) {
    const __m512 x = (singles_of<From, toward_zero>(operand.part[k]) * power).v;
    const __m512i whole = whole_word ? _mm512_maskz_cvtt_roundps_epu32(sixteen_lanes(), x, _MM_FROUND_NO_EXC)
                                     : _mm512_maskz_cvtt_roundps_epi32(sixteen_lanes(), x, _MM_FROUND_NO_EXC);
    const __m512 back = whole_word
                            ? _mm512_maskz_cvt_roundepu32_ps(sixteen_lanes(), whole, in_instruction<toward_zero>)
                            : _mm512_maskz_cvt_roundepi32_ps(sixteen_lanes(), whole, in_instruction<toward_zero>);
    // What does not fit becomes 2^32 - 1 without a sign, which no single is, or the least integer.
    __mmask16 unfit;
    if constexpr (L::bits == 32) {
      integers.part[k] = whole;
      unfit = _mm512_cmpeq_epu32_mask(whole, _mm512_set1_epi32(whole_word ? -1 : INT32_MIN));
    } else {
      integers.part[k] = _mm512_maskz_cvtepi32_epi16(sixteen_lanes(), whole);
      const __m512i fitting = is_signed ? _mm512_maskz_cvtepi16_epi32(sixteen_lanes(), integers.part[k])
                                        : _mm512_maskz_cvtepu16_epi32(sixteen_lanes(), integers.part[k]);
      unfit = _mm512_cmpneq_epu32_mask(whole, fitting);
    }
    computed.left |= std::uint32_t{unfit} << 16 * k;
    computed.inexact |= std::uint32_t{differing(x, back)} << 16 * k;
  }
  computed.lanes = joined(integers);
  return computed;
}

// Results as they have been computed, where a lane is left or inexact or the host flushes subnormals.
template <class R, class From, class Exact>
[[gnu::noinline]] __m512i truncated_with_care(Computed computed, word scale, Exact exact, Parts<From> operand) {
  {
    const SubnormalsHonoured honoured;
    pin(operand);
    if (honoured.were_flushed()) computed = truncated<R>(scale, operand);
    pin(computed.lanes);
    pin_word(computed.inexact);
  }
  return completed<R>(computed, exact, operand);
}

template <class R, class From, class Out, class Exact, class Units>
[[gnu::always_inline]] inline void store_truncated(Out out, word scale, Exact exact, const Units* units) {
  const Parts<From> operand(units);
  const Computed computed = truncated<R>(scale, operand);
  const bool is_told = computed.left == 0 && (computed.inexact == 0 || is_raised(inexact));
  store_lanes<R>(out, enabled_lanes<R>(out),
                 __builtin_expect(is_told && !flushes_subnormals(), 1)
                     ? computed.lanes
                     : truncated_with_care<R>(computed, scale, exact, operand));
}

}  // namespace

#endif

#endif
