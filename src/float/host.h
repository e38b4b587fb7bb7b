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
//             not, the vector is computed by itself (Reach::any) with terms that have room in place of the lesser ones.
//
// Lanes for which this does not hold are left to the reference: operands or results that are infinite or
// NaNs, results that overflow or come near, tiny ones that need not be exact. They, and subnormal operands, raise
// the host's flags, so HostFpu puts these back.
#ifndef KASTARRI_FLOAT_HOST_H
#define KASTARRI_FLOAT_HOST_H

#include <algorithm>
#include <cstring>

#include "float/destination.h"
#include "float/exact.h"
#include "float/host_fpu.h"
#include "frame/registers.h"

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
inline Words in_lane_order(Words v) { return in_order<std::uint64_t>(v); }

template <class F, Left Which>
using Kept = Range<F::bits == 16 && Which == Left::great_and_tiny ? single_bits_of_power(Half::least_exponent) : 0,
                   Which == Left::none ? no_bound : widened_largest<F>>;

// Singles rounded to halves; singles are not rounded again.
template <class F, Left Which, class Mode>
inline auto settled(const ExactSingles<Which>& x, const Mode& mode) {
  using Result = Settled<Kept<F, Which>>;
  const Words exact = pinned(words_of(x.value)), magnitude = exact & single_magnitude;
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

  Leading(const Doubles& exact_lower, const Doubles& exact_upper) {
    const Doubles lower = pinned(exact_lower), upper = pinned(exact_upper);
    const Words high = every_other_word<1>(in_bits<Words>(lower), in_bits<Words>(upper));
    const Words low = every_other_word<0>(in_bits<Words>(lower), in_bits<Words>(upper));
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

// Whether operands that measure by the rule are far apart in any lane.
template <class F, class... Ls, class Rule, class... Units>
[[gnu::always_inline, gnu::flatten]] inline bool any_far(Rule rule, const Units*... operands) {
  using Lane = typename F::lane;
  Vector<Lane> far = {};
  for (int from = 0; from < std::min({Ls::count...}); from += lanes_in_register<Lane>)
    far |= rule(Lanes<Ls, Reach::measured>(operands, from)...).far;
  return any_sign<Lane>(far);
}
// What a vector computed on the unit tells: the flags to raise, and whether a lane is left to the reference.
struct HostResult {
  word flags;
  bool some_left;
};

// A vector of results in registers, and a bit for each lane that is left.
template <class L>
struct RegisterResults {
  Vector<lane_of<L>> number[registers_of<L>];
  std::uint32_t left = 0;
};
// On their way to a destination.
template <class L, class Out>
struct ResultsTo : RegisterResults<L>, Destination<L, Out> {
  using Destination<L, Out>::Destination;
  void store() const { store_all(std::make_index_sequence<registers_of<L>>()); }

 private:
  template <std::size_t... K>
  void store_all(std::index_sequence<K...>) const {
    (Destination<L, Out>::store(K, this->number[K]), ...);
  }
};

// An operand with 1 in the lanes that are not enabled: it is no special number, nor far from any that are with it in
// its lane, and no operation here raises a flag for it.
template <class L>
struct EnabledLanes {
  template <class Unit, class Results>
  EnabledLanes(const Unit* operand, const Results& results) {
    constexpr auto one = static_cast<lane_of<L>>(format_of<L>::one);
    for (int k = 0; k < registers_of<L>; ++k)
      store_register(lane, k, results.enabled(load_register<lane_of<L>>(operand, k) ^ one, k) ^ one);
  }
  alignas(64) lane_of<L> lane[L::count];
};

// Register number k of results, of the steps of them from a lane on: singles or integers of 32 bits.
template <class R, class StepFrom>
[[gnu::always_inline, gnu::flatten]] inline Vector<lane_of<R>> packed(int k, StepFrom step_from) {
  using Lane = lane_of<R>;
  const int from = k * lanes_in_register<Lane>;
  const Words first = step_from(from);
  if constexpr (R::bits == 32) {
    return in_bits<Vector<Lane>>(first);
  } else if constexpr (std::is_same_v<typename R::number, half_float>) {
    return narrowed(first, step_from(from + step));
  } else {
    const auto second = in_bits<Register>(step_from(from + step));
    return in_bits<Vector<Lane>>(in_order<std::uint64_t>(pack_words(in_bits<Register>(first), second, Lane{})));
  }
}
template <class R, class Results, class StepFrom, std::size_t... K>
[[gnu::always_inline, gnu::flatten]] inline void pack(Results& results, StepFrom step_from, std::index_sequence<K...>) {
  ((results.number[K] = pinned(packed<R>(K, step_from))), ...);
}
template <class R, class Results, class StepFrom>
[[gnu::always_inline, gnu::flatten]] inline void pack(Results& results, StepFrom step_from) {
  pack<R>(results, step_from, std::make_index_sequence<registers_of<R>>());
}

// All steps before any is packed.
template <class R>
struct Steps {
  static constexpr int count = R::count / step;
  Words number[count];
};
template <class R, class StepFrom, std::size_t... K>
[[gnu::always_inline, gnu::flatten]] inline Steps<R> every_step(StepFrom step_from, std::index_sequence<K...>) {
  return {{step_from(static_cast<int>(K) * step)...}};
}

// A bit for each lane whose magnitude is outside of the range. Functions of its kind are called where they are seldom
// wanted: in the function itself they would take registers from it.
template <class Result, int Count>
[[gnu::noinline, gnu::cold]] std::uint32_t lanes_outside(const word* magnitudes) {
  std::uint32_t outside = 0;
  for (int i = 0; i < Count; ++i) {
    const int at = Result::paired ? i / step * step + paired_lane(i % step) : i;
    if (!Result::range::holds(magnitudes[at])) outside |= std::uint32_t{1} << i;
  }
  return outside;
}
template <int Count>
[[gnu::noinline, gnu::cold]] void clear_lanes(word* lanes, std::uint32_t which) {
  for (int i = 0; i < Count; ++i)
    if ((which >> i & 1) != 0) lanes[i] = 0;
}

// By the rule, which yields exact numbers.
template <class R, Reach Are, class... Ls, class Results, class Mode, class Rule, class... Units>
[[gnu::always_inline, gnu::flatten]] inline HostResult numbers_on_host(Mode mode, Results& results, Rule rule,
                                                                       const Units*... operands) {
  using F = format_of<R>;
  const auto settled_step = [&](int from) __attribute__((always_inline)) {
    return settled<F>(by_rule(rule, mode, Lanes<Ls, Are>(operands, from)...), mode);
  };
  using Result = decltype(settled_step(0));
  alignas(64) word magnitudes[R::count];
  Within<typename Result::range> within;
  Words dropped = {};
  const auto step_from = [&](int from) __attribute__((always_inline)) {
    const Result result = settled_step(from);
    if constexpr (Result::range::has_outside) store_register(magnitudes + from, 0, result.magnitudes);
    within.see(result.magnitudes);
    dropped |= result.dropped;
    return result.bits;
  };
  const HostFpu fpu(operands...);
  if constexpr (R::bits == 16 && Result::range::has_outside) {
    // To narrow what is outside of the range would raise flags of the host.
    Steps<R> steps = every_step<R>(step_from, std::make_index_sequence<Steps<R>::count>());
    if (__builtin_expect(within.some_not(), 0)) {
      results.left = lanes_outside<Result, R::count>(magnitudes);
      alignas(64) word lanes[R::count];
      for (int k = 0; k < Steps<R>::count; ++k) store_register(lanes, k, steps.number[k]);
      clear_lanes<R::count>(lanes, results.left);
      for (int k = 0; k < Steps<R>::count; ++k) steps.number[k] = load_register<word>(lanes, k);
    }
    pack<R>(
        results, [&](int from) __attribute__((always_inline)) { return steps.number[from / step]; });
  } else {
    pack<R>(results, step_from);
    if (__builtin_expect(within.some_not(), 0)) results.left = lanes_outside<Result, R::count>(magnitudes);
  }
  return {any_bit(dropped) ? word{inexact} : 0, results.left != 0};
}

// Terms far apart, by themselves.
template <class R>
struct FarResults {
  RegisterResults<R> results;
  HostResult host;
};
template <class R, class... Ls, class Mode, class Rule, class... Units>
[[gnu::noinline, gnu::flatten]] FarResults<R> far_on_host(Mode mode, Rule rule, const Units*... operands) {
  FarResults<R> far;
  far.host = numbers_on_host<R, Reach::any, Ls...>(mode, far.results, rule, operands...);
  return far;
}

// Result lane i = rule(operand lanes i ...) on the unit, exact numbers.
template <class R, class... Ls, class Mode, class Results, class Rule, class... Units>
[[gnu::always_inline, gnu::flatten]] inline HostResult on_host_in(const Mode& mode, Results& results, Rule rule,
                                                                  const Units*... operands) {
  if constexpr (measures<Rule, Lanes<Ls, Reach::measured>...>) {
    using F = format_of<R>;
    if (__builtin_expect(any_far<F, Ls...>(rule, operands...), 0)) {
      const FarResults<R> far = far_on_host<R, Ls...>(mode, rule, operands...);
      for (int k = 0; k < registers_of<R>; ++k) results.number[k] = far.results.number[k];
      results.left = far.results.left;
      return far.host;
    }
    return numbers_on_host<R, Reach::near, Ls...>(mode, results, rule, operands...);
  } else {
    return numbers_on_host<R, Reach::any, Ls...>(mode, results, rule, operands...);
  }
}

// Which lanes truncating leaves, a bit for each, and whether others are inexact: all of them once more, lane by lane.
struct LeftLanes {
  std::uint32_t lanes = 0;
  bool others_inexact = false;
};
template <class R, class From>
[[gnu::noinline, gnu::cold]] LeftLanes left_by_truncating(word scale, const void* operand) {
  alignas(64) word dropped[R::count], left[R::count];
  const HostFpu fpu(operand);  // to the end, for without shifts by a count a lane clang makes the bits on the unit too
  for (int from = 0; from < R::count; from += step) {
    const Truncated result = truncated<R>(Lanes<From, Reach::any>(operand, from), scale);
    store_register(dropped + from, 0, pinned(result.dropped));
    store_register(left + from, 0, pinned(result.left));
  }
  LeftLanes told;
  for (int i = 0; i < R::count; ++i) {
    const bool is_left = sign_mask(left[i]) != 0;
    told.lanes |= std::uint32_t{is_left} << i;
    told.others_inexact |= !is_left && dropped[i] != 0;
  }
  return told;
}

// Numbers times a power of two, truncated to integers.
template <class R, class From, class Results, class Units>
[[gnu::always_inline, gnu::flatten]] inline HostResult truncated_on_host(Results& results, word scale,
                                                                         const Units* operand) {
  Words dropped = {}, left = {};
  {
    const HostFpu fpu(operand);
    pack<R>(
        results, [&](int from) __attribute__((always_inline)) {
          const Truncated result = truncated<R>(Lanes<From, Reach::any>(operand, from), scale);
          dropped |= result.dropped;
          left |= result.left;
          return result.integers;
        });
  }
  if (__builtin_expect(!any_sign<word>(left), 1)) return {any_bit(dropped) ? word{inexact} : 0, false};
  const LeftLanes told = left_by_truncating<R, From>(scale, operand);
  results.left = told.lanes;
  return {told.others_inexact ? word{inexact} : 0, true};
}

template <class R, class... Ls, class Results, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult on_host(TiesAway, Results& results, Rule rule, const Units*... operands) {
  return on_host_in<R, Ls...>(ToNearestAway(), results, rule, operands...);
}

// Rounded downward, x + y = 0 is -0, but (+0) + (+0) is +0. The host, which rounds to nearest here, makes +0 of 1 + -1:
// the sign is set where either term has one.
template <class R, class... Ls, class Results, class Rule, std::size_t... K, class... Units>
[[gnu::always_inline]] inline void turn_zeros(Results& results, Rule rule, std::index_sequence<K...>,
                                              const Units*... operands) {
  using F = format_of<R>;
  using Lane = typename F::lane;
  const auto turned = [&](Vector<Lane> result, int k) __attribute__((always_inline)) {
    const auto measured = rule(Lanes<Ls, Reach::measured>(operands, k * lanes_in_register<Lane>)...);
    const auto zero = in_bits<Vector<Lane>>(magnitudes<F>(result) == 0);
    return result | (zero & measured.either_sign & static_cast<Lane>(F::sign));
  };
  ((results.number[K] = turned(results.number[K], K)), ...);
}

template <class R, class... Ls, class Results, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult on_host(Rounding rounding, Results& results, Rule rule,
                                                 const Units*... operands) {
  if (rounding == to_nearest) return on_host_in<R, Ls...>(ToNearest(), results, rule, operands...);
  const HostResult host = on_host_in<R, Ls...>(directed[rounding & 3], results, rule, operands...);
  if constexpr (measures<Rule, Lanes<Ls, Reach::measured>...>)
    if (rounding == downward)
      turn_zeros<R, Ls...>(results, rule, std::make_index_sequence<registers_of<R>>(), operands...);
  return host;
}

// Lanes, with those that are left completed by exact(number of the lane).
template <class L, class Out, class Exact>
[[gnu::noinline, gnu::cold]] void store_completed(Out out, lane_of<L>* lanes, std::uint32_t left, Exact exact) {
  for (int i = 0; i < L::count; ++i)
    if ((left >> i & 1) != 0) lanes[i] = static_cast<lane_of<L>>(exact(i));
  const Destination<L, Out> to(out);
  for (int k = 0; k < registers_of<L>; ++k) to.store(k, load_register<lane_of<L>>(lanes, k));
}
// Left lanes are completed in a copy: what is passed by its address cannot stay in registers.
template <class L, class Out, class Exact>
[[gnu::always_inline, gnu::flatten]] inline void store_results(Out out, const ResultsTo<L, Out>& results,
                                                               HostResult told, Exact exact) {
  if (told.flags != 0) raise_sticky(told.flags);
  if (__builtin_expect(!told.some_left, 1)) return results.store();
  alignas(64) lane_of<L> lanes[L::count];
  for (int k = 0; k < registers_of<L>; ++k) store_register(lanes, k, results.number[k]);
  store_completed<L>(out, lanes, results.left, exact);
}

// --- The unit's interface (unit.h) --------------------------------------------------------------------

constexpr bool rounds_by_instruction = false;

template <class R, class... Ls, class Out, class Mode, class Rule, class Exact, class... Units>
[[gnu::always_inline, gnu::flatten]] inline void store_by_rule(Out out, Mode mode, bool tells_inexact, Rule rule,
                                                               Exact exact, const Units*... operands) {
  ResultsTo<R, Out> results(out);
  HostResult told;
  if constexpr (Destination<R, Out>::is_predicated)
    told = on_host<R, Ls...>(mode, results, rule, EnabledLanes<Ls>(operands, results).lane...);
  else
    told = on_host<R, Ls...>(mode, results, rule, operands...);
  if (!tells_inexact) told.flags = 0;
  store_results<R>(out, results, told, [=](int i) { return exact(Read<Ls>(operands)[i]...); });
}

template <class R, class From, class Out, class Exact, class Units>
[[gnu::always_inline, gnu::flatten]] inline void store_truncated(Out out, word scale, Exact exact,
                                                                 const Units* operand) {
  ResultsTo<R, Out> results(out);
  const HostResult told = truncated_on_host<R, From>(results, scale, operand);
  store_results<R>(out, results, told, [=](int i) { return exact(Read<From>(operand)[i]); });
}

}  // namespace

#endif
