// Operations on whole registers: the fast path, then the reference for the lanes that it left.
#ifndef KASTARRI_FLOAT_VECTORS_H
#define KASTARRI_FLOAT_VECTORS_H

#include "float/operations.h"
#include "tables/float_constants.h"

namespace {

template <class L>
using lane_of = typename L::container;

// A lane alone in a whole word: compilers would compute in 16 bits, where constants hold processors' decoders up.
inline word in_word(word lane) {
  asm("" : "+r"(lane));
  return lane;
}

// A lane of a vector, which is one of many places: there the reference is called, alone it is inlined.
template <class Op, class F, class... X>
[[gnu::noinline]] word exact_lane(Environment& env, X... x) {
  return Op::template exact<F>(env, x...);
}

// results[i] = Op of lanes i of the operands. The results are apart from the operands.
template <class L, class Op, class... Units>
inline void compute(Environment& env, lane_of<L>* results, const Units*... operands) {
  using F = format_of<L>;
  if (__builtin_expect(Op::template fast<L>(env, results, operands...), 0)) {
    for (int i = 0; i < L::count; ++i)
      if (is_nan<F>(results[i]))
        results[i] = static_cast<lane_of<L>>(exact_lane<Op, F>(env, word{Read<L>(operands)[i]}...));
  }
}

// Where results go, by registers: to all lanes, or to the enabled ones.
template <class L, class Out>
class Destination {
 public:
  explicit Destination(Out units) : units_(units) {}

  Vector<lane_of<L>> enabled(Vector<lane_of<L>> lanes, int) const { return lanes; }
  void store(int k, Vector<lane_of<L>> result) const { store_register(units_, k, result); }

 private:
  Out units_;
};
template <class L, class Unit, class PredicateUnit>
class Destination<L, UnitsUnder<Unit, PredicateUnit, false>> {
 public:
  explicit Destination(UnitsUnder<Unit, PredicateUnit, false> out) : units_(out.units) { mask_.expand(out.predicate); }

  Vector<lane_of<L>> enabled(Vector<lane_of<L>> lanes, int k) const {
    return lanes & load_register<lane_of<L>>(mask_.lane, k);
  }
  void store(int k, Vector<lane_of<L>> result) const {
    const auto old = load_register<lane_of<L>>(units_, k);
    store_register(units_, k, old ^ enabled(old ^ result, k));
  }

 private:
  Unit* units_;
  LaneMask<L::bits, L::count> mask_;
};

template <class L>
constexpr int registers_of = L::count / lanes_in_register<lane_of<L>>;

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
  Environment env;
  for (int i = 0; i < L::count; ++i)
    if (is_negative<F>(left[i]))
      results[i] = static_cast<Lane>(exact_lane<Op, F>(env, word{Read<L>(a)[i]}, word{Read<L>(b)[i]}));
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

template <class L, class Op, class Unit, class... Units>
[[gnu::always_inline]] inline void apply(Environment& env, Unit* out, const Units*... operands) {
  if constexpr (L::count == 1) {  // by the reference, which is quicker for one
    Write<L>(out).put(0, Op::template exact<format_of<L>>(env, in_word(Read<L>(operands)[0])...));
  } else {
    alignas(64) lane_of<L> results[L::count];
    compute<L, Op>(env, results, operands...);
    lanes<L::count>(
        Write<L>(out), [](auto lane) { return lane; }, Read<L>(results));
  }
}

template <class L, class Op, class Unit, class... Units>
inline void apply(Unit* out, const Units*... operands) {
  if constexpr (L::count > 1 && is_of_numbers<Op>) {
    apply_to_numbers<L, Op>(out, operands...);
  } else {
    Environment env;
    apply<L, Op>(env, out, operands...);
  }
}

// An operand with +0 in the lanes that are not enabled. No operation here raises a flag for zeros.
template <class L>
struct EnabledLanes {
  template <class Unit>
  EnabledLanes(const Unit* operand, const LaneMask<L::bits, L::count>& enabled) {
    const Read<L> from(operand);
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < L::count; ++i) lane[i] = static_cast<lane_of<L>>(from[i] & enabled.lane[i]);
  }
  alignas(64) lane_of<L> lane[L::count];
};

template <class L, class Op, class Unit, class PredicateUnit, class... Units>
inline void apply(UnitsUnder<Unit, PredicateUnit, false> out, const Units*... operands) {
  if constexpr (L::count == 1) {
    if ((out.predicate[0] & 1) != 0) apply<L, Op>(out.units, operands...);
  } else if constexpr (is_of_numbers<Op>) {
    apply_to_numbers<L, Op>(out, operands...);
  } else {
    LaneMask<L::bits, L::count> enabled;
    enabled.expand(out.predicate);
    alignas(64) lane_of<L> results[L::count];
    Environment env;
    compute<L, Op>(env, results, EnabledLanes<L>(operands, enabled).lane...);
    const Read<L> result(results), old(out.units);
    const Write<L> to(out.units);
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < L::count; ++i)  // by masks: of a choice the compiler makes a store under a branch
      to.put(i, static_cast<lane_of<L>>(old[i] ^ ((old[i] ^ result[i]) & enabled.lane[i])));
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
