// Operations on whole registers: the fast path, then the reference for the lanes that it left.
#ifndef KASTARRI_FLOAT_VECTORS_H
#define KASTARRI_FLOAT_VECTORS_H

#include "float/operations.h"
#include "tables/float_constants.h"

namespace {

// A lane alone in a whole word: compilers would compute in 16 bits, where constants hold processors' decoders up.
inline word in_word(word lane) {
  asm("" : "+r"(lane));
  return lane;
}

// A lane of a vector, which is one of many places: there the reference is called, alone it is inlined.
template <class Op, class F, class... X>
[[gnu::noinline]] word exact_lane(Rounding rounding, X... x) {
  Environment env(rounding);
  return Op::template exact<F>(env, x...);
}

// --- Operations on numbers ------------------------------------------------------------------------------

// The lanes with a NaN by the reference.
template <class L, class Op, class Out, class Units>
[[gnu::noinline]] void apply_with_nans(Out out, const Units* a, const Units* b) {
  using F = format_of<L>;
  using Lane = lane_of<L>;
  const Destination<L, Out> to(out);
  alignas(64) Lane results[L::count], left[L::count];
  for (int k = 0; k < registers_of<L>; ++k) {
    const auto x = load_register<Lane>(a, k), y = load_register<Lane>(b, k);
    store_register(left, k, to.enabled(nan_signs<F>(x) | nan_signs<F>(y), k));
    store_register(results, k, Op::of_numbers(x, y));
  }
  for (int i = 0; i < L::count; ++i)
    if (is_negative<F>(left[i]))
      results[i] = static_cast<Lane>(exact_lane<Op, F>(to_nearest, word{Read<L>(a)[i]}, word{Read<L>(b)[i]}));
  for (int k = 0; k < registers_of<L>; ++k) to.store(k, load_register<Lane>(results, k));
}

// Results of an operation on numbers, by registers. They may lie where one of the operands does.
template <class L, class Op, class Out, class Units>
inline void apply_to_numbers(Out out, const Units* a, const Units* b) {
  using Lane = lane_of<L>;
  const Destination<L, Out> to(out);
  const auto nans = [](const Units* v, int k) { return nan_signs<format_of<L>>(load_register<Lane>(v, k)); };
  Vector<Lane> left{};
  for (int k = 0; k < registers_of<L>; ++k) left |= to.enabled(nans(a, k) | nans(b, k), k);
  if (__builtin_expect(any_sign<Lane>(left), 0)) return apply_with_nans<L, Op>(out, a, b);
  for (int k = 0; k < registers_of<L>; ++k)
    to.store(k, Op::of_numbers(load_register<Lane>(a, k), load_register<Lane>(b, k)));
}

// --- Operations on the unit -----------------------------------------------------------------------------

// Whether the unit has a rule for an operation. One lane is quickest by the reference nevertheless, but for a single
// where instructions carry their rounding: a half would have to be widened and narrowed.
template <class L>
constexpr bool is_for_unit = L::count > 1 || (rounds_by_instruction && L::bits == 32);
template <class Op, class F, class = void>
constexpr bool has_unit_rule = false;
template <class Op, class F>
constexpr bool has_unit_rule<Op, F, std::void_t<decltype(Op::template on_unit<F>)>> = true;

template <class L, class>
using same_layout = L;

template <class L, class Op, class Out, class... Units>
[[gnu::always_inline]] inline void apply(Rounding mode, Out out, const Units*... operands) {
  using F = format_of<L>;
  if constexpr (!is_for_unit<L> || !has_unit_rule<Op, F>) {
    Environment env(mode);
    Write<L>(units_of(out)).put(0, Op::template exact<F>(env, in_word(Read<L>(operands)[0])...));
  } else {
    const auto exact = [mode](auto... lanes) { return exact_lane<Op, F>(mode, word{lanes}...); };
    store_by_rule<L, same_layout<L, Units>...>(out, Op::rounding(mode), Op::tells_inexact, Op::template on_unit<F>,
                                               exact, operands...);
  }
}

template <class L, class Op, class Out, class... Units>
[[gnu::always_inline]] inline void apply(Out out, const Units*... operands) {
  if constexpr (L::count > 1 && is_of_numbers<Op>) {
    apply_to_numbers<L, Op>(out, operands...);
  } else {
    if (L::count == 1 && !is_enabled(out)) return;
    apply<L, Op>(round_mode(), out, operands...);
  }
}

// An operation on bits alone, without flags, as a rule on lanes.
template <class Op, class L>
constexpr auto bits_rule = [](lane_of<L> lane) {
  if constexpr (L::count == 1)
    return Op::template on_bits<format_of<L>>(in_word(lane));
  else
    return Op::template on_bits<format_of<L>>(lane);
};

// Constant `number` in the layout's format.
template <class L>
constexpr word constant(word number) {
  const FloatConstant& pair = float_constants[number & 15];
  return L::bits == 16 ? pair.half : pair.single;
}

// The layout of the scalar that a unit holds.
template <class Unit>
using layout_of_unit = std::conditional_t<sizeof(Unit) == 2, f16x1, f32x1>;

// The lanes for which the relation holds, by registers; those with a NaN aside.
template <class L, class Op>
struct Related : LaneMask<L::bits, L::count> {
  template <class Units>
  Related(const Units* a, const Units* b) {
    using Lane = lane_of<L>;
    Vector<Lane> nans{};
    for (int k = 0; k < registers_of<L>; ++k) {
      const auto x = load_register<Lane>(a, k), y = load_register<Lane>(b, k);
      nans |= nan_signs<format_of<L>>(x) | nan_signs<format_of<L>>(y);
      store_register(this->lane, k, Op::template on_numbers<format_of<L>>(x, y));
    }
    some_nan = any_sign<Lane>(nans);
  }
  bool some_nan;
};

template <class L, class Op, class Bits, class Units>
[[gnu::noinline]] void compare_with_nans(Bits* out, const Units* a, const Units* b) {
  using F = format_of<L>;
  Related<L, Op> holds(a, b);
  const Read<L> x(a), y(b);
  Environment env;
  for (int i = 0; i < L::count; ++i)
    if (any_nan<F>(x[i], y[i]))
      holds.lane[i] = static_cast<lane_of<L>>(Op::template exact<F>(env, x[i], y[i]) ? -1 : 0);
  holds.collect(out);
}

// Bit i of the predicate = the relation of lanes i.
template <class L, class Op, class Bits, class Units>
inline void compare(Bits* out, const Units* a, const Units* b) {
  if constexpr (L::count == 1) {
    Environment env;
    out[0] = static_cast<Bits>(Op::template exact<format_of<L>>(env, in_word(Read<L>(a)[0]), in_word(Read<L>(b)[0])));
  } else {
    const Related<L, Op> holds(a, b);
    if (__builtin_expect(holds.some_nan, 0)) return compare_with_nans<L, Op>(out, a, b);
    holds.collect(out);
  }
}

}  // namespace

#endif
