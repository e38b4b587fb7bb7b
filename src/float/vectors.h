// Operations on whole registers: the fast path, then the reference for the lanes that it left.
#ifndef KASTARRI_FLOAT_VECTORS_H
#define KASTARRI_FLOAT_VECTORS_H

#include <cstring>

#include "float/operations.h"
#include "tables/float_constants.h"

namespace {

// One lane is quickest by the reference, but for the fused operations on singles, whose exact sum is long.
template <class Op, class L>
constexpr bool is_fast_alone = false;
template <bool Subtract>
constexpr bool is_fast_alone<Fused<Subtract>, f32x1> = rounds_by_instruction;

// --- Results in a register ---------------------------------------------------------------------------

template <class L, class Op>
constexpr bool is_by_register = (L::count > 1 ||
                                 is_fast_alone<Op, L>)&&rounds_by_instruction&& std::is_base_of_v<OnUnit, Op>;

template <class L, class Op, class Out, class... Units>
[[gnu::always_inline]] inline void apply_by_register(Environment& env, Out out, const Units*... operands) {
  store_by_register<L>(
      out, [ =, &env ](auto& results) __attribute__((always_inline)) {
        return Op::template fast<L>(env, results, operands...);
      },
      [=, &env](int i) { return Op::template exact<format_of<L>>(env, Read<L>(operands)[i]...); });
}

// --- Results in memory -------------------------------------------------------------------------------

// Results with the lanes that the fast path left, which are NaNs, by the reference. By value, for what is passed by its
// address cannot stay in registers.
template <class L, class Op, class... Units>
[[gnu::noinline, gnu::cold]] Results<L> completed(Environment& env, Results<L> results, const Units*... operands) {
  using F = format_of<L>;
  for (int i = 0; i < L::count; ++i)
    if (is_nan<F>(results.lane[i]))
      results.lane[i] = static_cast<lane_of<L>>(Op::template exact<F>(env, Read<L>(operands)[i]...));
  return results;
}

// Lane i = Op of lanes i of the operands.
template <class L, class Op, class... Units>
[[gnu::always_inline, gnu::flatten]] inline Results<L> compute(Environment& env, const Units*... operands) {
  using F = format_of<L>;
  Results<L> results;
  if constexpr (L::count == 1 && !is_fast_alone<Op, L>) {
    results.lane[0] = static_cast<lane_of<L>>(Op::template exact<F>(env, Read<L>(operands)[0]...));
  } else if (__builtin_expect(Op::template fast<L>(env, results.lane, operands...), 0)) {
    const Results<L> all = completed<L, Op>(env, results, operands...);
    results = all;
  }
  return results;
}

template <class L, class Op, class Unit, class... Units>
[[gnu::always_inline]] inline void apply(Environment& env, Unit* out, const Units*... operands) {
  if constexpr (is_by_register<L, Op>) {
    apply_by_register<L, Op>(env, out, operands...);
  } else {
    const Results<L> results = compute<L, Op>(env, operands...);
    std::memcpy(out, results.lane, sizeof results.lane);
  }
}

template <class L, class Op, class Unit, class... Units>
[[gnu::always_inline]] inline void apply(Unit* out, const Units*... operands) {
  Environment env;
  apply<L, Op>(env, out, operands...);
}

// An operand with 1 in the lanes that are not enabled: it is no special number, nor far from any that are with it in
// its lane, and no operation here raises a flag for it.
template <class L>
struct EnabledLanes {
  template <class Unit>
  EnabledLanes(const Unit* operand, const LaneMask<L::bits, L::count>& enabled) {
    constexpr auto one = static_cast<lane_of<L>>(format_of<L>::one);
    const Read<L> from(operand);
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < L::count; ++i)
      lane[i] = static_cast<lane_of<L>>((from[i] & enabled.lane[i]) | (one & ~enabled.lane[i]));
  }
  alignas(64) lane_of<L> lane[L::count];
};

template <class L, class Op, class Unit, class PredicateUnit, class... Units>
inline void apply(UnitsUnder<Unit, PredicateUnit, false> out, const Units*... operands) {
  Environment env;
  if constexpr (is_by_register<L, Op>) {
    apply_by_register<L, Op>(env, out, operands...);
  } else {
    LaneMask<L::bits, L::count> enabled;
    enabled.expand(out.predicate);
    const Results<L> results = compute<L, Op>(env, EnabledLanes<L>(operands, enabled).lane...);
    const Read<L> result(results.lane), old(out.units);
    const Write<L> to(out.units);
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < L::count; ++i)  // by masks: of a choice the compiler makes a store under a branch
      to.put(i, static_cast<lane_of<L>>(old[i] ^ ((old[i] ^ result[i]) & enabled.lane[i])));
  }
}

// An operation on bits alone, without flags, as a rule on lanes.
template <class Op, class L>
constexpr auto bits_rule = [](lane_of<L> lane) { return Op::template on_bits<format_of<L>>(lane); };

// Constant `number` in the layout's format.
template <class L>
constexpr word constant(word number) {
  const FloatConstant& pair = float_constants[number & 15];
  return L::bits == 16 ? pair.half : pair.single;
}

// The layout of the scalar that a unit holds.
template <class Unit>
using layout_of_unit = std::conditional_t<sizeof(Unit) == 2, f16x1, f32x1>;

// Bit i of the predicate = the relation of lanes i.
template <class L, class Op, class Bits, class Units>
inline void compare(Bits* out, const Units* a, const Units* b) {
  using F = format_of<L>;
  const Read<L> x(a), y(b);
  if constexpr (L::count == 1) {
    Environment env;
    out[0] = static_cast<Bits>(Op::template exact<F>(env, x[0], y[0]));
  } else {
    LaneMask<L::bits, L::count> holds;
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < L::count; ++i)
      holds.lane[i] = static_cast<lane_of<L>>(Op::template on_numbers<F>(x[i], y[i]) ? -1 : 0);
    lane_of<L> left = 0;
    for (int i = 0; i < L::count; ++i) left = static_cast<lane_of<L>>(left | nan_mask<F>(x[i], y[i]));
    if (__builtin_expect(left != 0, 0)) {
      Environment env;
      for (int i = 0; i < L::count; ++i)
        holds.lane[i] = static_cast<lane_of<L>>(Op::template exact<F>(env, x[i], y[i]) ? -1 : 0);
    }
    holds.collect(out);
  }
}

}  // namespace

#endif
