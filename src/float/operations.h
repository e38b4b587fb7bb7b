// The operations. Each has `exact`, one number by the reference, and may have `on_unit`, a rule for whole vectors
// (unit.h). Those that only a NaN keeps from integers have `of_numbers` or `on_numbers`, a register of numbers.
#ifndef KASTARRI_FLOAT_OPERATIONS_H
#define KASTARRI_FLOAT_OPERATIONS_H

#include <type_traits>

#include "float/destination.h"
#include "float/reference.h"
#include "float/unit.h"
#include "frame/lanes.h"
#include "frame/registers.h"

namespace {

// Operations that the unit computes are rounded by RoundMode and tell when that drops anything, unless they say else.
struct RoundedByMode {
  static Rounding rounding(Rounding round_mode) { return round_mode; }
  static constexpr bool tells_inexact = true;
};

// A float of the unit, its sign turned.
template <bool Turned, class T>
inline auto turned_if(const T& x) {
  if constexpr (Turned)
    return -x;
  else
    return x;
}

// a + b, or a - b.
template <bool Subtract>
struct Sum : RoundedByMode {
  template <class F>
  [[gnu::always_inline]] static word exact(Environment& env, word a, word b) {
    return add<F>(env, a, Subtract ? negated<F>(b) : b);
  }
  template <class F>
  static constexpr auto on_unit = [](auto x, auto y) { return sum<F>(x, turned_if<Subtract>(y)); };
};
using ADD = Sum<false>;
using SUB = Sum<true>;

struct MUL : RoundedByMode {
  template <class F>
  [[gnu::always_inline]] static word exact(Environment& env, word a, word b) {
    return multiply<F>(env, a, b);
  }
  template <class F>
  static constexpr auto on_unit = [](auto a, auto b) { return product<F>(a, b); };
};

// acc +- a * b
template <bool Subtract>
struct Fused : RoundedByMode {
  template <class F>
  [[gnu::always_inline]] static word exact(Environment& env, word acc, word a, word b) {
    return multiply_add<F>(env, acc, Subtract ? negated<F>(a) : a, b);
  }
  template <class F>
  static constexpr auto on_unit = [](auto acc, auto a, auto b) { return fused<F>(acc, turned_if<Subtract>(a), b); };
};
using MULA = Fused<false>;
using MULS = Fused<true>;

// --- Order --------------------------------------------------------------------------------------------

// Lanes whose top bit is set where one of v is a NaN.
template <class F>
inline Vector<typename F::lane> nan_signs(Vector<typename F::lane> v) {
  using Lane = typename F::lane;
  return (v & static_cast<Lane>(F::sign - 1)) + static_cast<Lane>(F::sign - 1 - F::infinity);
}

// Lanes as signed integers.
inline Vector<std::int16_t> ordered(Vector<std::uint16_t> v) { return reinterpret_cast<Vector<std::int16_t>>(v); }
inline Vector<std::int32_t> ordered(Vector<std::uint32_t> v) { return reinterpret_cast<Vector<std::int32_t>>(v); }

template <bool Less, bool NumberWins>
struct Extreme {
  template <class F>
  static word exact(Environment& env, word a, word b) {
    constexpr auto choose = Less ? minimum<F> : maximum<F>;
    return NumberWins ? number_of<F>(env, a, b, choose) : choose(env, a, b);
  }
  // Numbers are in the order of their bits as integers, unless both are negative: then of the others, those turned.
  template <class V>
  static V of_numbers(V a, V b) {
    const auto turned = ordered(a & b) >> (8 * sizeof(a[0]) - 1);
    const auto x = ordered(a) ^ turned, y = ordered(b) ^ turned;
    return reinterpret_cast<V>((Less ? (x < y ? x : y) : (x > y ? x : y)) ^ turned);
  }
};
template <class Op>
constexpr bool is_of_numbers = false;
template <bool Less, bool NumberWins>
constexpr bool is_of_numbers<Extreme<Less, NumberWins>> = true;
using MIN = Extreme<true, false>;
using MAX = Extreme<false, false>;
using MINNUM = Extreme<true, true>;
using MAXNUM = Extreme<false, true>;

// --- Bits only ----------------------------------------------------------------------------------------

struct ABS {
  template <class F>
  static constexpr word on_bits(word a) {
    return magnitude<F>(a);
  }
};
struct NEG {
  template <class F>
  static constexpr word on_bits(word a) {
    return a ^ F::sign;
  }
};
struct MOV {
  template <class F>
  static constexpr word on_bits(word a) {
    return a;
  }
};

// One bit for the class: bits 0-4 -infinity, -normal, -subnormal, -0, +0, bits 5-7 +subnormal, +normal,
// +infinity, bits 8 and 9 the signalling and the quiet NaN. By masks, so that compilers vectorise it.
struct CLSFY {
  template <class F, class Lane>
  static constexpr Lane on_bits(Lane a) {
    const auto m = static_cast<Lane>(magnitude<F>(a));
    const auto above = [m](word bound) { return mask_below(static_cast<Lane>(bound), m); };
    const Lane some = above(0), normal = above(F::unit - 1), infinite = above(F::largest), nan = above(F::infinity);
    const auto up_from_zero = static_cast<Lane>(1 - (some + 2 * (normal + 2 * infinite)));  // 1, 2, 4, 8
    const auto down_from_zero = static_cast<Lane>(9 - ((some ^ infinite) & 3) - up_from_zero);
    const auto positive = static_cast<Lane>(up_from_zero << 4);
    const auto quiet = static_cast<Lane>(256 + (a & F::quiet) / (F::quiet / 256));
    return chosen(nan, quiet, chosen(mask_below(m, a), down_from_zero, positive));
  }
};

// --- Rounding to an integer ---------------------------------------------------------------------------

enum class Direction { away, up, down, zero, by_mode };

template <Direction D>
struct Integral {
  static constexpr bool tells_inexact = D == Direction::by_mode;
  static auto rounding(Rounding round_mode) {
    if constexpr (D == Direction::away)
      return TiesAway();
    else
      return D == Direction::up     ? upward
             : D == Direction::down ? downward
             : D == Direction::zero ? toward_zero
                                    : round_mode;
  }
  template <class F>
  static word exact(Environment& env, word a) {
    return to_integral<F>(env, a, rounding(env.rounding), tells_inexact);
  }
  // Halves are integers before they are narrowed: what is inexact is the rounding to an integer.
  template <class F>
  static constexpr auto on_unit = [](const auto& mode, auto x) { return integral(mode, x); };
};
using FIROUND = Integral<Direction::away>;
using FICEIL = Integral<Direction::up>;
using FIFLOOR = Integral<Direction::down>;
using FITRUNC = Integral<Direction::zero>;
using FIRINT = Integral<Direction::by_mode>;

// --- Comparisons --------------------------------------------------------------------------------------

// Holds(x, y) on integers in the order of the numbers, which for equal zeros are equal; the answer when
// unordered; whether a quiet NaN is invalid.
template <class Holds, bool Unordered, bool Signalling>
struct Relation {
  // Unlike order(), both zeros are 0.
  template <class F>
  static auto key(Vector<typename F::lane> v) {
    return signed_as(ordered(v & static_cast<typename F::lane>(F::sign - 1)), ordered(v));
  }
  template <class F>
  static auto key(word x) {
    return static_cast<std::int32_t>((magnitude<F>(x) ^ sign_of<F>(x)) - sign_of<F>(x));
  }
  template <class F>
  static auto on_numbers(Vector<typename F::lane> a, Vector<typename F::lane> b) {
    return Holds()(key<F>(a), key<F>(b));
  }
  template <class F>
  static bool exact(Environment& env, word a, word b) {
    if (!any_nan<F>(a, b)) return Holds()(key<F>(a), key<F>(b));
    if (Signalling || is_signalling<F>(a) || is_signalling<F>(b)) env.raise(invalid);
    return Unordered;
  }
};

struct Equal {
  template <class T>
  constexpr auto operator()(T x, T y) const {
    return x == y;
  }
};
struct Less {
  template <class T>
  constexpr auto operator()(T x, T y) const {
    return x < y;
  }
};
struct LessOrEqual {
  template <class T>
  constexpr auto operator()(T x, T y) const {
    return x <= y;
  }
};
struct Greater {
  template <class T>
  constexpr auto operator()(T x, T y) const {
    return x > y;
  }
};
struct GreaterOrEqual {
  template <class T>
  constexpr auto operator()(T x, T y) const {
    return x >= y;
  }
};
struct NotEqual {
  template <class T>
  constexpr auto operator()(T x, T y) const {
    return x != y;
  }
};
struct Never {
  template <class T>
  constexpr auto operator()(T, T) const {
    return T{} != T{};
  }
};

using OEQ = Relation<Equal, false, false>;
using OLT = Relation<Less, false, true>;
using OLE = Relation<LessOrEqual, false, true>;
using OGT = Relation<Greater, false, true>;
using OGE = Relation<GreaterOrEqual, false, true>;
using UEQ = Relation<Equal, true, false>;
using ULT = Relation<Less, true, true>;
using ULE = Relation<LessOrEqual, true, true>;
using UN = Relation<Never, true, false>;
using ULEQ = Relation<LessOrEqual, true, false>;
using ULTQ = Relation<Less, true, false>;
using UNEQ = Relation<NotEqual, true, false>;

// --- Exponents ----------------------------------------------------------------------------------------

struct NEXP0 {
  template <class F>
  static word exact(Environment& env, word a) {
    return scaled<F>(env, a, -exponent_of<F>(a));
  }
};
struct NEXP01 {
  template <class F>
  static word exact(Environment& env, word a) {
    const int exponent = exponent_of<F>(a);
    return scaled<F>(env, a, (exponent & 1) - exponent);
  }
};
struct MKDADJ {
  template <class F>
  static word exact(Environment&, word a, word b) {
    const int exponent = exponent_of<F>(a) - exponent_of<F>(b);
    return power_of_two<F>(exponent < F::least_exponent      ? F::least_exponent
                           : exponent > F::greatest_exponent ? F::greatest_exponent
                                                             : exponent);
  }
};
struct MKSADJ {
  template <class F>
  static word exact(Environment&, word a) {
    const int exponent = exponent_of<F>(a);
    return power_of_two<F>((exponent - (exponent & 1)) / 2);  // floor
  }
};

// r times the power of two of s.
struct ADDEXPM {
  template <class F>
  static word exact(Environment& env, word r, word s) {
    return scaled<F>(env, r, exponent_of<F>(s));
  }
};

}  // namespace

#endif
