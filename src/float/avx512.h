// The AVX-512 unit, whose instructions carry their rounding and raise no flags: the control word, the writing of
// which costs as much as a whole vector does, is left alone unless the host flushes subnormals.
//
// A result is inexact when rounding up and rounding down disagree on it. So every vector is computed both ways, and
// as the mode has it. The flush-to-zero and denormals-are-zero bits alone of the host still count;
// store_honouring_subnormals sees to them.
#ifndef KASTARRI_FLOAT_AVX512_H
#define KASTARRI_FLOAT_AVX512_H

#ifdef __AVX512F__

#include "float/bits.h"
#include "float/destination.h"
#include "frame/intrinsics.h"
#include "frame/lanes.h"

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

template <class L>
inline __m256i half_register(const typename L::container* lanes, int from) {
  return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(lanes + from));
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

// --- A whole vector -----------------------------------------------------------------------------------

constexpr word flushing = 0x8040;  // flush-to-zero and denormals-are-zero

// What the unit makes of a vector: a register of results, and a bit a lane for those that are inexact and for those
// that are left to the reference.
struct Computed {
  __m512i lanes;
  std::uint32_t inexact;
  std::uint32_t left;
};

inline word control_word() {
  word mxcsr;
  asm volatile("stmxcsr %0" : "=m"(mxcsr));
  return mxcsr;
}
inline void set_control_word(word mxcsr) { asm volatile("ldmxcsr %0" : : "m"(mxcsr) : "memory"); }

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

template <class L>
inline void store_lanes(void* results, __m512i lanes) {
  if constexpr (L::count == 1) {
    *static_cast<in_memory<typename L::container>*>(results) =
        static_cast<typename L::container>(_mm_cvtsi128_si32(_mm512_castsi512_si128(lanes)));
  } else if constexpr (L::count * L::bits == 256) {
    _mm256_storeu_si256(static_cast<__m256i*>(results), _mm512_castsi512_si256(lanes));
  } else {
    _mm512_storeu_si512(results, lanes);
  }
}

template <class L>
inline __m512i load_lanes(const void* lanes) {
  using Lane = in_memory<typename L::container>;
  if constexpr (L::count == 1) return _mm512_set1_epi32(static_cast<int>(*static_cast<const Lane*>(lanes)));
  return _mm512_loadu_si512(lanes);
}

// Sixteen numbers by the rule, rounded by R.
template <Rounding R, class... Ls, class Rule, class... Units>
inline __m512 rounded(Rule rule, int from, const Units*... operands) {
  return rule(load_sixteen<Ls, R>(reinterpret_cast<const typename Ls::container*>(operands), from)...).v;
}

// Sixteen numbers as singles, rounded up and down.
struct Bounds {
  __m512 up;
  __m512 down;
};
template <class... Ls, class Rule, class... Units>
inline Bounds bounds(Rule rule, int from, const Units*... operands) {
  return {rounded<upward, Ls...>(rule, from, operands...), rounded<downward, Ls...>(rule, from, operands...)};
}

// The bound that R rounds to, or either if R is to nearest. Sums of 0 are rounded up to +0 and down to -0.
template <Rounding R>
inline Sixteen<R> either_of(const Bounds& x) {
  if constexpr (R == downward) return {x.down};
  if constexpr (R != toward_zero) return {x.up};
  return {_mm512_castsi512_ps(
      _mm512_maskz_min_epu32(sixteen_lanes(), _mm512_castps_si512(x.up), _mm512_castps_si512(x.down)))};
}

// Where a number has been moved up to the middle of two halves.
inline __mmask16 moved_to_middle(const Bounds& x) {
  const __m512i up = _mm512_castps_si512(x.up), down = _mm512_castps_si512(x.down);
  const __m512i dropped = _mm512_and_si512(up, _mm512_set1_epi32(0x1FFF));
  return _mm512_mask_cmpneq_epi32_mask(_mm512_cmpeq_epi32_mask(dropped, _mm512_set1_epi32(0x1000)), up, down);
}

inline __m512 singles_of(__m256i halves) {
  return _mm512_maskz_cvt_roundph_ps(sixteen_lanes(), halves, _MM_FROUND_NO_EXC);
}
inline __mmask16 other_than(__m256i halves, const Bounds& x) {
  const __m512 singles = singles_of(halves);
  return static_cast<__mmask16>(differing(x.up, singles) | differing(x.down, singles));
}

// A register of 16-bit lanes and a mask of its lanes, of their parts.
template <class L>
inline __m512i joined(__m256i low, __m256i high) {
  const __m512i lower = _mm512_castsi256_si512(low);
  return L::count == 32 ? _mm512_inserti64x4(lower, high, 1) : lower;
}
template <class L>
inline std::uint32_t joined(__mmask16 low, __mmask16 high) {
  return L::count == 32 ? _mm512_kunpackw(high, low) : low;
}

// Results, and the lanes that are inexact or hold NaNs.
struct Told {
  __m512i lanes;
  std::uint32_t inexact;
};

// Halves are rounded twice, as singles before. That is rounding once, and to nearest either bound will do, unless a
// number is moved to the middle of two halves, to which sums and products of two do not come near without being
// singles. What the results wait for is computed first.
template <class L, Rounding R, class... Ls, class Rule, class... Units>
inline Told halves_by_rule(Rule rule, const Units*... operands) {
  const Bounds low = bounds<Ls...>(rule, 0, operands...), high = bounds<Ls...>(rule, L::count - 16, operands...);
  const __m256i low_halves = halves_of(either_of<R>(low)), high_halves = halves_of(either_of<R>(high));
  __m512i lanes = joined<L>(low_halves, high_halves);
  if constexpr (R == to_nearest && sizeof...(Ls) > 2) {
    const __mmask16 low_moved = moved_to_middle(low), high_moved = moved_to_middle(high);
    if (__builtin_expect(!_mm512_kortestz(low_moved, high_moved), 0))
      lanes = joined<L>(halves_of(Sixteen<R>{_mm512_mask_mov_ps(low.up, low_moved, low.down)}),
                        halves_of(Sixteen<R>{_mm512_mask_mov_ps(high.up, high_moved, high.down)}));
  }
  return {lanes, joined<L>(other_than(low_halves, low), other_than(high_halves, high))};
}

template <Rounding R, class... Ls, class Rule, class... Units>
inline Told singles_by_rule(Rule rule, const Units*... operands) {
  const Bounds x = bounds<Ls...>(rule, 0, operands...);
  return {_mm512_castps_si512(rounded<R, Ls...>(rule, 0, operands...)), differing(x.up, x.down)};
}

// Integers among the numbers of a format are numbers of that format.
template <class L, Rounding R, class Mode, class Rule, class Units>
inline Told integers_by_rule(const Mode& mode, Rule rule, const Units* operand) {
  const auto* lanes = reinterpret_cast<const typename L::container*>(operand);
  const Sixteen<R> x = load_sixteen<L, R>(lanes, 0), low = rule(mode, x);
  if constexpr (L::bits == 32) return {_mm512_castps_si512(low.v), differing(x.v, low.v)};
  if constexpr (L::bits == 16) {
    const Sixteen<R> y = load_sixteen<L, R>(lanes, 16), high = rule(mode, y);
    return {joined<L>(halves_of(low), halves_of(high)), joined<L>(differing(x.v, low.v), differing(y.v, high.v))};
  }
}

// compute(R) for a mode, with the rounding of instructions as a constant.
template <class Compute>
[[gnu::always_inline]] inline Computed by_rounding(Rounding rounding, const Compute& compute) {
  switch (rounding) {
    case upward:
      return compute(std::integral_constant<Rounding, upward>());
    case downward:
      return compute(std::integral_constant<Rounding, downward>());
    case toward_zero:
      return compute(std::integral_constant<Rounding, toward_zero>());
    default:
      return compute(std::integral_constant<Rounding, to_nearest>());
  }
}
template <class Compute>
[[gnu::always_inline]] inline Computed by_rounding(TiesAway, const Compute& compute) {
  return compute(std::integral_constant<Rounding, to_nearest>());
}

// Result lane i = rule(operand lanes i ...), as on_host. NaNs are left, and inexact results that may be due to overflow
// or be tiny. What is told of lanes is told of the enabled ones.
template <class L, Rounding R, class... Ls, class Mode, class Rule, class... Units>
[[gnu::always_inline]] inline Computed by_instruction(const Mode& mode, std::uint32_t enabled, Rule rule,
                                                      const Units*... operands) {
  using F = format_of<L>;
  constexpr bool to_integers = std::is_invocable_v<Rule, Mode, decltype(load_sixteen<Ls, R>(nullptr, 0))...>;
  const Told results = [&] {
    if constexpr (to_integers)
      return integers_by_rule<L, R>(mode, rule, operands...);
    else if constexpr (L::bits == 16)
      return halves_by_rule<L, R, Ls...>(rule, operands...);
    else
      return singles_by_rule<R, Ls...>(rule, operands...);
  }();
  const std::uint32_t told = results.inexact & enabled;
  const std::uint32_t left = to_integers ? outside<L::bits>(told, results.lanes, 0, F::infinity)
                                         : outside<L::bits>(told, results.lanes, F::unit + 1, F::largest - 1);
  return {results.lanes, told, left};
}

// Numbers times a power of two, truncated to integers of layout L. Lanes that have no such integer are left.
template <class L, class From, class Units>
inline Computed truncated_by_instruction(word scale, const Units* operand) {
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
    left |= std::uint32_t{unfit} << from;
    fractions |= std::uint32_t{differing(x, back)} << from;
    return integers;
  };
  __m512i integers = sixteen(0);
  if constexpr (L::bits == 16)
    integers = _mm512_inserti64x4(_mm512_zextsi256_si512(_mm512_maskz_cvtepi32_epi16(sixteen_lanes(), integers)),
                                  _mm512_maskz_cvtepi32_epi16(sixteen_lanes(), sixteen(16)), 1);
  return {integers, fractions, left};
}

// A bit a lane of layout L. A lane alone is there sixteen times.
template <class L, class Unit>
inline std::uint32_t enabled_lanes(const Unit*) {
  return ~std::uint32_t{0};
}
template <class L, class Unit, class PredicateUnit>
inline std::uint32_t enabled_lanes(UnitsUnder<Unit, PredicateUnit, false> out) {
  return L::count == 1 ? *out.predicate & 1u : *out.predicate;
}

// A vector of results in a register, with what the unit tells of them. Of lanes that are not enabled it tells nothing,
// and what lies there is kept.
template <class L>
class RegisterResults {
 public:
  template <class Out>
  explicit RegisterResults(Out out) : enabled_(enabled_lanes<L>(out)) {}

  // compute(enabled lanes), and what it tells.
  template <class Compute>
  [[gnu::always_inline]] HostResult take(const Compute& compute) {
    const Computed computed = compute(enabled_);
    lanes_ = computed.lanes;
    left_ = computed.left;
    return {(computed.inexact & ~left_) != 0 ? word{inexact} : 0, left_ != 0};
  }

  // Lanes that are left, by exact(number of the lane).
  template <class Exact>
  void complete(const Exact& exact) {
    using Lane = typename L::container;
    alignas(64) Lane lane[sizeof lanes_ / sizeof(Lane)];
    _mm512_store_si512(lane, lanes_);
    complete_lanes<L>(lane, left_, exact);
    lanes_ = _mm512_load_si512(lane);
  }

  template <class Unit>
  void store(Unit* out) const {
    store_lanes<L>(out, lanes_);
  }
  template <class Unit, class PredicateUnit>
  void store(UnitsUnder<Unit, PredicateUnit, false> out) const {
    const __m512i old = load_lanes<L>(out.units);
    store_lanes<L>(out.units, L::bits == 16 ? _mm512_mask_mov_epi16(old, enabled_, lanes_)
                                            : _mm512_mask_mov_epi32(old, static_cast<__mmask16>(enabled_), lanes_));
  }

 private:
  __m512i lanes_;
  std::uint32_t left_;
  std::uint32_t enabled_;
};

// Results by fast(results), which says whether it has left a lane, and such lanes by exact(number of the lane). What is
// seldom wanted is in functions apart, which take copies: what they had by reference would have to be in memory always.
template <class L, class Out, class Exact>
[[gnu::noinline, gnu::cold]] void store_completed(Out out, RegisterResults<L> results, Exact exact) {
  results.complete(exact);
  results.store(out);
}

// With subnormals neither read nor written as zeros. Compilers cannot move arithmetic past the writes (see HostFpu):
// operands come from memory that is unknown before the one, and results, with what is told of them, have to be in
// memory before the other.
template <class L, class Out, class Fast, class Exact>
[[gnu::noinline, gnu::cold]] void store_honouring_subnormals(Out out, Fast fast, Exact exact) {
  const word found = control_word();
  set_control_word(found & ~flushing);
  RegisterResults<L> results(out);
  const bool some_left = fast(results);
  asm volatile("" : "+m"(results) : : "memory");
  set_control_word(found);
  if (some_left) return store_completed<L>(out, results, exact);
  results.store(out);
}

template <class L, class Out, class Fast, class Exact>
[[gnu::always_inline]] inline void store_results(Out out, Fast fast, Exact exact) {
  if (__builtin_expect(control_word() & flushing, 0)) return store_honouring_subnormals<L>(out, fast, exact);
  RegisterResults<L> results(out);
  if (__builtin_expect(fast(results), 0)) return store_completed<L>(out, results, exact);
  results.store(out);
}

}  // namespace

#endif

#endif
