// The host's floating-point unit as a fast path for whole vectors, a register at a time.
//
// Its control word (MXCSR) is the host program's: rounding, and flags that have to be found as they were left.
// To write it, or to read flags that have just been raised, costs more than a whole vector does. So the unit
// computes exactly, in a format with room enough: then no rounding mode counts and no flag is raised. The
// rounding is done afterwards, on the bits of the result, and what it drops tells whether it is inexact.
//
//   halves    are computed as singles, 24 bits, in which every half is a number and the product of two exact;
//   singles   as doubles, 53 bits, in which the product of two is exact;
//   sums      have room there when the exponents of their terms are near, which is measured before; when a lane's are
//             not, the vector is computed in the long way, in which a term far below the other is lifted (apart).
//
// Lanes for which this does not hold are left to the reference: operands or results that are infinite or
// NaNs, results that overflow or come near, tiny ones that need not be exact. They, and subnormal operands, raise
// the host's flags, so HostFpu puts these back.
#ifndef KASTARRI_FLOAT_HOST_H
#define KASTARRI_FLOAT_HOST_H

#include <algorithm>
#include <cstring>

#include "float/exact.h"
#include "float/host_fpu.h"
#include "frame/packs.h"

namespace {

// --- Results ------------------------------------------------------------------------------------------

// Magnitudes between which a lane has its result: from Least on, or 0, up to Greatest. Others are left.
constexpr word no_bound = ~word{0};
template <word Least, word Greatest>
struct Range {
  static constexpr bool has_outside = Greatest != no_bound;
  static constexpr word greatest = Greatest;
  static constexpr bool holds(word magnitude) {
    return magnitude <= Greatest && (magnitude >= Least || magnitude == 0);
  }
};

// Whether magnitudes that have been seen are all in the range.
template <class R>
class Within;
template <word Least, word Greatest>
class Within<Range<Least, Greatest>> {
 public:
#ifdef __AVX2__
  void see(Words magnitudes) {
    if constexpr (Greatest == no_bound) return;
    const auto next = in_bits<Integers>(magnitudes), next_least = in_bits<Integers>(magnitudes + below);
    greatest_ = next > greatest_ ? next : greatest_;
    if constexpr (Least > 0) least_ = next_least < least_ ? next_least : least_;
  }
  bool some_not() const {
    if constexpr (Greatest == no_bound) return false;
    auto outside = greatest_ > static_cast<std::int32_t>(Greatest);
    if constexpr (Least > 0) outside |= least_ < static_cast<std::int32_t>(Least + below);
    return any_bit(in_bits<Words>(outside));
  }

 private:
  // Added to all, it makes 0 the greatest.
  static constexpr word below = 0x7FFFFFFF;
  Integers greatest_ = {}, least_ = Integers{} + INT32_MAX;
#else
  void see(Words magnitudes) {
    if constexpr (Greatest == no_bound) return;
    outside_ |= Greatest - magnitudes;
    if constexpr (Least > 0) outside_ |= (magnitudes - Least) & (0 - magnitudes);
  }
  bool some_not() const { return any_sign<word>(outside_); }

 private:
  Words outside_ = {};
#endif
};

// Results in a format, as the bits of singles, with the magnitudes that tell which of them are left and what has been
// dropped from them.
template <class R, bool Paired = false>
struct Settled {
  using range = R;
  // Whether lanes come register by register within a block, as pairs of registers tell them.
  static constexpr bool paired = Paired;
  Words bits, magnitudes, dropped;
};
inline Words in_lane_order(Words v) { return in_bits<Words>(in_order<std::uint64_t>(bits_of(v))); }

template <class F, Left Which>
using Kept = Range<F::bits == 16 && Which == Left::great_and_tiny ? single_bits_of_power(Half::least_exponent) : 0,
                   Which == Left::none ? no_bound : widened_largest<F>>;

// Singles rounded to halves; singles are not rounded again.
template <class F, Left Which, class Mode>
inline auto settled(const ExactSingles<Which>& x, const Mode& mode) {
  using Result = Settled<Kept<F, Which>>;
  const Words exact = words_of(x.value), magnitude = exact & single_magnitude;
  if constexpr (F::bits == 32) return Result{exact, magnitude, {}};
  constexpr int excess = Single::fraction_bits - Half::fraction_bits;
  constexpr word low = (word{1} << excess) - 1;
  return Result{(exact + mode.template increment<excess>(exact)) & ~low, magnitude, exact & low};
}

// Doubles as their upper words, and the leading bits of them as singles with the rest. Where a number is below the
// normal singles, or among the last few of them, these are not right.
struct Leading {
  static constexpr int of_high = 20;  // bits of the fraction
  static constexpr word rebias = word{1023 - Single::bias} << of_high;
  using range = Range<rebias + (1 << of_high), rebias + (Single::infinity >> 3) - 2>;

  Leading(const Doubles& lower, const Doubles& upper) {
    const Words high = every_other_word<1>(bits_of(lower), bits_of(upper));
    const Words low = every_other_word<0>(bits_of(lower), bits_of(upper));
    magnitude = high & single_magnitude;
    sign = high ^ magnitude;
    const auto rebiased = in_bits<Integers>(magnitude - rebias);
    const auto exponent_and_fraction = in_bits<Words>(rebiased > 0 ? rebiased : Integers{});
    kept = exponent_and_fraction << (Single::fraction_bits - of_high) | low >> rest_bits;
    rest = low & all_of_rest;
  }
  Words magnitude, sign, kept, rest;
};

template <class F, class Mode>
inline auto settled(const ExactDoubles& x, const Mode& mode) {
  const Leading leading(x.lower, x.upper);
  if constexpr (F::bits == 32) {
    const Words bits = rounded(leading.kept, leading.rest, leading.sign, mode) | leading.sign;
    return Settled<Leading::range, true>{in_lane_order(bits), leading.magnitude, leading.rest};
  } else {
    // Infinities and NaNs have to be told; no sum or product of halves is below the normal singles.
    const Words finite = in_bits<Words>(in_bits<Integers>(leading.magnitude) <= std::int32_t{Leading::range::greatest});
    const Words odd = leading.kept | (in_bits<Words>(leading.rest != 0) & 1) | (~finite & Single::infinity);
    return settled<F>(ExactSingles<Left::great_and_tiny>{in_bits<Singles>(in_lane_order(odd | leading.sign))}, mode);
  }
}

template <class F, class Exact, class Mode>
inline auto settled(const ExactBut<Exact>& x, const Mode& mode) {
  auto result = settled<F>(x.value, mode);
  const Words left = sign_masks(x.left);
  result.magnitudes |= (result.paired ? in_lane_order(left) : left) & single_magnitude;
  return result;
}
// A half that is rounded to an integer is a half.
template <class F, class Mode>
inline auto settled(const WholeNumber& x, const Mode&) {
  return Settled<Range<0, widened_largest<F>>>{x.bits, x.magnitudes, x.dropped};
}

// Where lane i of a step is in the order of pairs.
constexpr int paired_lane(int i) {
  const int pair = i / 2;
  return 2 * (pair % blocks_in_register * 2 + pair / blocks_in_register) + i % 2;
}

// Singles that are halves, of two steps, as halves.
inline Vector<std::uint16_t> narrowed(Words first, Words last) {
#ifdef __F16C__
  const auto eight = [](Words x) { return _mm256_cvtps_ph(in_bits<__m256>(x), 0); };
  return in_bits<Vector<std::uint16_t>>(_mm256_set_m128i(eight(last), eight(first)));
#else
  // 2^-112 times as much has the exponent of a half, and subnormal halves are subnormal singles; signs by themselves.
  const auto unsigned_half = [](Words x) {
    return in_bits<Register>(words_of(in_bits<Singles>(x) * 0x1p-112f) << 1 >> 14);
  };
  const auto pack = [](Register a, Register b) {
    return in_bits<Vector<std::uint16_t>>(pack_words(a, b, std::int16_t{}));
  };
  return pack(unsigned_half(first), unsigned_half(last)) |
         (pack(in_bits<Register>(first), in_bits<Register>(last)) & std::uint16_t{Half::sign});
#endif
}

// --- A whole vector -----------------------------------------------------------------------------------

// What operands measure by the rule, register by register of the format.
template <class F, class... Ls, class Rule, class Use, class... Units>
[[gnu::always_inline]] inline void measure(Rule rule, Use use, const Units*... operands) {
  for (int from = 0; from < std::min({Ls::count...}); from += lanes_in_register<typename F::lane>)
    use(from, rule(Lanes<Ls, Reach::measured>(operands, from)...));
}
template <class F, class... Ls, class Rule, class... Units>
[[gnu::always_inline]] inline bool any_far(Rule rule, const Units*... operands) {
  Vector<typename F::lane> far = {};
  measure<F, Ls...>(
      rule, [&](int, auto measured) { far |= measured.far; }, operands...);
  return any_sign<typename F::lane>(far);
}

// Sums that are 0, rounded downward: -0 but for terms that are both +0.
template <class F, class... Ls, class Rule, class... Units>
[[gnu::always_inline]] inline void turn_zeros(typename F::lane* results, Rule rule, const Units*... operands) {
  measure<F, Ls...>(
      rule,
      [&](int from, auto measured) {
        using Lane = typename F::lane;
        const auto result = load_register<Lane>(results + from, 0);
        const auto zero = in_bits<Vector<Lane>>(magnitudes<F>(result) == 0);
        store_register(results + from, 0, result | (zero & measured.either_sign & static_cast<Lane>(F::sign)));
      },
      operands...);
}

// Results of all lanes by a function that yields a step of them.
template <class R, class OneStep>
[[gnu::always_inline]] inline void every_step(typename R::container* results, OneStep one_step) {
  using Lane = typename R::container;
  for (int from = 0; from < R::count; from += lanes_in_register<Lane>) {
    if constexpr (R::bits == 32) {
      store_register(results + from, 0, pinned(one_step(from)));
    } else if constexpr (std::is_same_v<typename R::number, half_float>) {
      const Words first = one_step(from);
      store_register(results + from, 0, pinned(narrowed(first, one_step(from + step))));
    } else {
      const auto first = in_bits<Register>(one_step(from));
      const auto both = bits_of(pack_words(first, in_bits<Register>(one_step(from + step)), Lane{}));
      store_register(results + from, 0, pinned(in_order<std::uint64_t>(both)));
    }
  }
}

// By the rule, which yields exact numbers.
template <class R, Reach Are, class... Ls, class Mode, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult numbers_on_host(Mode mode, typename R::container* results, Rule rule,
                                                         const Units*... operands) {
  using F = format_of<R>;
  const auto settled_step = [&](int from) {
    return settled<F>(by_rule(rule, mode, Lanes<Ls, Are>(operands, from)...), mode);
  };
  using Result = decltype(settled_step(0));
  alignas(64) word magnitudes[R::count];
  Within<typename Result::range> within;
  Words dropped = {};
  every_step<R>(results, [&](int from) {
    const Result result = settled_step(from);
    if constexpr (Result::range::has_outside) store_register(magnitudes + from, 0, result.magnitudes);
    within.see(result.magnitudes);
    dropped |= result.dropped;
    return result.bits;
  });
  const word flags = any_bit(dropped) ? word{inexact} : 0;
  if (__builtin_expect(!within.some_not(), 1)) return {flags, false};
  for (int i = 0; i < R::count; ++i) {
    const int at = Result::paired ? i / step * step + paired_lane(i % step) : i;
    if (!Result::range::holds(magnitudes[at])) results[i] = static_cast<typename R::container>(~word{0});
  }
  return {flags, true};
}

template <class R, class... Ls, class Mode, class Rule, class... Units>
[[gnu::noinline, gnu::flatten]] HostResult far_on_host(const Mode& mode, typename R::container* results, Rule rule,
                                                       const Units*... operands) {
  return numbers_on_host<R, Reach::any, Ls...>(mode, results, rule, operands...);
}

// Result lane i = rule(operand lanes i ...) on the unit, exact numbers. The results are apart from the operands.
// Flattened: calls would pass registers through memory.
template <class R, class... Ls, class Mode, class Rule, class... Units>
[[gnu::always_inline, gnu::flatten]] inline HostResult on_host_in(const Mode& mode, typename R::container* results,
                                                                  Rule rule, const Units*... operands) {
  const HostFpu fpu(operands...);
  if constexpr (measures<Rule, Lanes<Ls, Reach::measured>...>) {
    if (__builtin_expect(any_far<format_of<R>, Ls...>(rule, operands...), 0)) {
      // By themselves: what is passed by its address has to be in memory from the beginning.
      Results<R> far;
      const HostResult host = far_on_host<R, Ls...>(mode, far.lane, rule, operands...);
      std::memcpy(results, far.lane, sizeof far.lane);
      return host;
    }
    return numbers_on_host<R, Reach::near, Ls...>(mode, results, rule, operands...);
  } else {
    return numbers_on_host<R, Reach::any, Ls...>(mode, results, rule, operands...);
  }
}

// Numbers times a power of two, truncated to integers.
template <class R, class From, class Units>
[[gnu::flatten]] inline HostResult truncated_on_host(typename R::container* results, word scale, const Units* operand) {
  const HostFpu fpu(operand);
  Words dropped = {}, left = {};
  every_step<R>(results, [&](int from) {
    const Truncated result = truncated<R>(Lanes<From, Reach::any>(operand, from), scale);
    dropped |= result.dropped;
    left |= result.left;
    return result.integers;
  });
  return {any_bit(dropped) ? word{inexact} : 0, any_sign<word>(left)};
}

template <class R, class... Ls, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult on_host(TiesAway, typename R::container* results, Rule rule,
                                                 const Units*... operands) {
  return on_host_in<R, Ls...>(ToNearestAway(), results, rule, operands...);
}
template <class R, class... Ls, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult on_host(Rounding rounding, typename R::container* results, Rule rule,
                                                 const Units*... operands) {
  if (rounding == to_nearest) return on_host_in<R, Ls...>(ToNearest(), results, rule, operands...);
  const HostResult host = on_host_in<R, Ls...>(directed[rounding & 3], results, rule, operands...);
  if constexpr (measures<Rule, Lanes<Ls, Reach::measured>...>)
    if (rounding == downward) turn_zeros<format_of<R>, Ls...>(results, rule, operands...);
  return host;
}

}  // namespace

#endif
