// A model a floating-point operation: operands are bit patterns of one format, the answer bits and flags.
#ifndef KASTARRI_TESTS_FLOAT_MODEL_H
#define KASTARRI_TESTS_FLOAT_MODEL_H

#include "float/exact.h"

namespace model {

using exact::Answer;
using exact::Bits;
using exact::Format;
using exact::Number;

// --- NaN operands ---------------------------------------------------------------------------------------

template <int Count>
bool any_nan(const Format& f, const Bits* x) {
  for (int i = 0; i < Count; ++i)
    if (f.nan(x[i])) return true;
  return false;
}

// The first of them, in the given order, made quiet.
template <int Count>
Answer first_nan(const Format& f, const Bits* x) {
  Answer answer{0, 0};
  for (int i = Count; i-- > 0;) {
    if (f.nan(x[i])) answer.bits = x[i] / f.quiet() % 2 ? x[i] : x[i] + f.quiet();
    if (f.signalling(x[i])) answer.flags = 16;
  }
  return answer;
}

// --- Arithmetic -----------------------------------------------------------------------------------------

template <class Operation>
Answer two(const Format& f, int mode, const Bits* x, Operation operation) {
  if (any_nan<2>(f, x)) return first_nan<2>(f, x);
  Number a(f, x[0]), b(f, x[1]), r;
  operation(r, a, b, exact::modes[mode]);
  return round(f, r, exact::modes[mode]);
}
inline Answer ADD(const Format& f, int mode, const Bits* x) { return two(f, mode, x, mpfr_add); }
inline Answer SUB(const Format& f, int mode, const Bits* x) { return two(f, mode, x, mpfr_sub); }
inline Answer MUL(const Format& f, int mode, const Bits* x) { return two(f, mode, x, mpfr_mul); }

// Accumulator, then factors.
template <bool Subtract>
Answer fused(const Format& f, int mode, const Bits* x) {
  const Bits factors_first[] = {x[1], x[2], x[0]};
  if (any_nan<3>(f, x)) return first_nan<3>(f, factors_first);
  Number acc(f, x[0]), a(f, x[1]), b(f, x[2]), r;
  if (Subtract) mpfr_neg(a, a, MPFR_RNDN);
  mpfr_fma(r, a, b, acc, exact::modes[mode]);
  return round(f, r, exact::modes[mode]);
}
inline Answer MULA(const Format& f, int mode, const Bits* x) { return fused<false>(f, mode, x); }
inline Answer MULS(const Format& f, int mode, const Bits* x) { return fused<true>(f, mode, x); }
inline Answer MADDN(const Format& f, int, const Bits* x) { return fused<false>(f, 0, x); }
inline Answer MSUBN(const Format& f, int, const Bits* x) { return fused<true>(f, 0, x); }

// --- Bits -----------------------------------------------------------------------------------------------

inline Answer ABS(const Format& f, int, const Bits* x) { return {x[0] % f.sign(), 0}; }
inline Answer NEG(const Format& f, int, const Bits* x) {
  return {x[0] < f.sign() ? x[0] + f.sign() : x[0] - f.sign(), 0};
}
inline Answer MOV(const Format&, int, const Bits* x) { return {x[0], 0}; }

inline Answer CLSFY(const Format& f, int, const Bits* x) {
  const Bits least_normal = f.unit(), m = f.magnitude(x[0]);
  if (f.nan(x[0])) return {f.signalling(x[0]) ? 0x100u : 0x200u, 0};
  const int away_from_zero = (m > 0) + (m >= least_normal) + (m == f.infinity());
  return {Bits{1} << (x[0] < f.sign() ? 4 + away_from_zero : 3 - away_from_zero), 0};
}

// --- Order ----------------------------------------------------------------------------------------------

template <bool Smaller>
Answer extreme(const Format& f, const Bits* x) {
  if (any_nan<2>(f, x)) return first_nan<2>(f, x);
  Number a(f, x[0]), b(f, x[1]);
  const int order = mpfr_cmp(a, b);
  // Equal numbers of unlike sign are zeros.
  const bool a_is_less = order < 0 || (order == 0 && mpfr_signbit(a));
  return {a_is_less == Smaller ? x[0] : x[1], 0};
}
template <bool Smaller>
Answer extreme_number(const Format& f, const Bits* x) {
  if (f.nan(x[0]) == f.nan(x[1])) return extreme<Smaller>(f, x);
  return {f.nan(x[0]) ? x[1] : x[0], first_nan<2>(f, x).flags};
}
inline Answer MIN(const Format& f, int, const Bits* x) { return extreme<true>(f, x); }
inline Answer MAX(const Format& f, int, const Bits* x) { return extreme<false>(f, x); }
inline Answer MINNUM(const Format& f, int, const Bits* x) { return extreme_number<true>(f, x); }
inline Answer MAXNUM(const Format& f, int, const Bits* x) { return extreme_number<false>(f, x); }

// The relation holds when a < b, a == b, a > b, unordered.
template <bool Less, bool Equal, bool Greater, bool Unordered, bool QuietIsInvalid>
Answer relation(const Format& f, int, const Bits* x) {
  if (any_nan<2>(f, x)) return {Unordered, QuietIsInvalid ? 16 : first_nan<2>(f, x).flags};
  Number a(f, x[0]), b(f, x[1]);
  const int order = mpfr_cmp(a, b);
  return {order < 0 ? Less : order == 0 ? Equal : Greater, 0};
}
inline constexpr auto OEQ = relation<0, 1, 0, 0, 0>;
inline constexpr auto OLT = relation<1, 0, 0, 0, 1>;
inline constexpr auto OLE = relation<1, 1, 0, 0, 1>;
inline constexpr auto OGT = relation<0, 0, 1, 0, 1>;
inline constexpr auto OGE = relation<0, 1, 1, 0, 1>;
inline constexpr auto UEQ = relation<0, 1, 0, 1, 0>;
inline constexpr auto ULT = relation<1, 0, 0, 1, 1>;
inline constexpr auto ULE = relation<1, 1, 0, 1, 1>;
inline constexpr auto UN = relation<0, 0, 0, 1, 0>;
inline constexpr auto ULEQ = relation<1, 1, 0, 1, 0>;
inline constexpr auto ULTQ = relation<1, 0, 0, 1, 0>;
inline constexpr auto UNEQ = relation<1, 0, 1, 1, 0>;

// --- Integers -------------------------------------------------------------------------------------------

inline Answer integral(const Format& f, const Bits* x, mpfr_rnd_t mode, bool tells_inexact) {
  if (any_nan<1>(f, x)) return first_nan<1>(f, x);
  Number a(f, x[0]);
  const bool inexact = mpfr_number_p(a) && round_to_integer(a, 0, mode);
  return {round(f, a, MPFR_RNDN).bits, inexact && tells_inexact ? 1u : 0u};
}
inline Answer FIROUND(const Format& f, int, const Bits* x) { return integral(f, x, MPFR_RNDNA, false); }
inline Answer FICEIL(const Format& f, int, const Bits* x) { return integral(f, x, MPFR_RNDU, false); }
inline Answer FIFLOOR(const Format& f, int, const Bits* x) { return integral(f, x, MPFR_RNDD, false); }
inline Answer FITRUNC(const Format& f, int, const Bits* x) { return integral(f, x, MPFR_RNDZ, false); }
inline Answer FIRINT(const Format& f, int mode, const Bits* x) { return integral(f, x, exact::modes[mode], true); }

// value / 2^scale
inline Answer from_integer(const Format& f, int mode, std::int64_t value, int scale) {
  Number x;
  mpfr_set_sj(x, value, MPFR_RNDN);
  mpfr_div_2si(x, x, scale, MPFR_RNDN);
  return round(f, x, exact::modes[mode]);
}

// a * 2^scale truncated to an integer from low to high.
inline Answer to_integer(const Format& f, Bits a, int scale, std::int64_t low, std::int64_t high) {
  if (f.nan(a)) return {static_cast<Bits>(high), 16};
  Number x(f, a);
  const bool finite = mpfr_number_p(x);
  const bool inexact = finite && round_to_integer(x, scale, MPFR_RNDZ);
  if (mpfr_cmp_si(x, static_cast<long>(low)) < 0) return {static_cast<Bits>(low), 16};
  if (!finite || mpfr_cmp_ui(x, static_cast<unsigned long>(high)) > 0) return {static_cast<Bits>(high), 16};
  return {static_cast<Bits>(mpfr_get_sj(x, MPFR_RNDZ)), inexact ? 1u : 0u};
}

// The number in another format.
inline Answer convert(const Format& from, const Format& to, int mode, Bits a) {
  const Bits sign = a >= from.sign() ? to.sign() : 0;
  if (from.nan(a)) {
    const Bits fraction = first_nan<1>(from, &a).bits % from.unit();
    const Bits aligned = static_cast<Bits>(std::uint64_t{fraction} * to.unit() / from.unit());
    return {sign + to.infinity() + aligned, from.signalling(a) ? 16u : 0u};
  }
  return round(to, Number(from, a), exact::modes[mode]);
}

// --- Exponents ------------------------------------------------------------------------------------------

inline bool plain(const Format& f, Bits x) { return f.magnitude(x) != 0 && f.magnitude(x) < f.infinity(); }
inline long exponent(const Format& f, Bits x) { return plain(f, x) ? mpfr_get_exp(Number(f, x)) - 1 : 0; }

inline Answer times_power(const Format& f, Bits x, long power, mpfr_rnd_t mode) {
  if (!plain(f, x)) return {x, 0};
  Number a(f, x);
  mpfr_mul_2si(a, a, power, MPFR_RNDN);
  return round(f, a, mode);
}
inline Bits power(const Format& f, long e) { return static_cast<Bits>(e - f.least + 1) * f.unit(); }

inline Answer NEXP0(const Format& f, int, const Bits* x) { return times_power(f, x[0], -exponent(f, x[0]), MPFR_RNDZ); }
inline Answer NEXP01(const Format& f, int, const Bits* x) {
  const long e = exponent(f, x[0]);
  return times_power(f, x[0], e % 2 == 0 ? -e : 1 - e, MPFR_RNDZ);
}
inline Answer MKDADJ(const Format& f, int, const Bits* x) {
  const long e = exponent(f, x[0]) - exponent(f, x[1]);
  return {power(f, e < f.least ? f.least : e > f.greatest ? f.greatest : e), 0};
}
inline Answer MKSADJ(const Format& f, int, const Bits* x) {
  const long e = exponent(f, x[0]);
  return {power(f, e >= 0 ? e / 2 : -((1 - e) / 2)), 0};
}
inline Answer ADDEXPM(const Format& f, int mode, const Bits* x) {
  return times_power(f, x[0], exponent(f, x[1]), exact::modes[mode]);
}
inline Answer ADDEXP(const Format& f, int, const Bits* x) {
  return {times_power(f, x[0], exponent(f, x[1]), MPFR_RNDZ).bits, 0};
}

}  // namespace model

#endif
