// What floating-point operations have to give, by MPFR: values as exact numbers, rounded once to the format, with
// the flags that IEEE 754 tells.
#ifndef KASTARRI_TESTS_FLOAT_EXACT_H
#define KASTARRI_TESTS_FLOAT_EXACT_H

#include <cstdint>

#define MPFR_USE_INTMAX_T
#define MPFR_USE_NO_MACRO  // they take no class for an mpfr_t
#include <mpfr.h>

namespace exact {

using Bits = std::uint32_t;

// Result bits and the flags raised: inexact 1, underflow 2, overflow 4, invalid 16.
struct Answer {
  Bits bits;
  unsigned flags;
};

struct Format {
  int width, precision, least, greatest;  // exponents of normal numbers
  Bits sign() const { return Bits{1} << (width - 1); }
  Bits unit() const { return Bits{1} << (precision - 1); }
  Bits infinity() const { return sign() - unit(); }
  Bits quiet() const { return unit() / 2; }
  Bits magnitude(Bits x) const { return x % sign(); }
  bool nan(Bits x) const { return magnitude(x) > infinity(); }
  bool signalling(Bits x) const { return nan(x) && x / quiet() % 2 == 0; }
};

inline constexpr Format half{16, 11, -14, 15};
inline constexpr Format single{32, 24, -126, 127};

// As RoundMode counts them.
inline constexpr mpfr_rnd_t modes[] = {MPFR_RNDN, MPFR_RNDZ, MPFR_RNDU, MPFR_RNDD};

// A number that takes no memory but its own: with room for any sum of products of singles, exactly, or for what an
// operand of a format is.
class Number {
 public:
  Number() : Number(700) {}
  Number(const Format& format, Bits x) : Number(64) {
    const Bits m = format.magnitude(x), field = m / format.unit(), fraction = m % format.unit();
    if (m > format.infinity()) {
      mpfr_set_nan(value_);
    } else if (m == format.infinity()) {
      mpfr_set_inf(value_, 1);
    } else {
      const long exponent = format.least - format.precision + (field == 0 ? 1 : static_cast<long>(field));
      mpfr_set_ui_2exp(value_, field == 0 ? fraction : fraction + format.unit(), exponent, MPFR_RNDN);
    }
    mpfr_setsign(value_, value_, x >= format.sign(), MPFR_RNDN);
  }
  Number(const Number&) = delete;
  Number& operator=(const Number&) = delete;
  operator mpfr_ptr() { return value_; }
  operator mpfr_srcptr() const { return value_; }

 private:
  friend Answer round(const Format& f, const Number& x, mpfr_rnd_t mode);

  explicit Number(mpfr_prec_t precision) {
    mpfr_custom_init(digits_, precision);
    mpfr_custom_init_set(value_, MPFR_NAN_KIND, 0, precision, digits_);
  }

  alignas(mp_limb_t) unsigned char digits_[88];
  mpfr_t value_;
};

// x * 2^power rounded to an integer; with the fraction that was lost, inexact.
inline bool round_to_integer(Number& x, long power, mpfr_rnd_t mode) {
  mpfr_mul_2si(x, x, power, MPFR_RNDN);
  if (mpfr_integer_p(x)) return false;
  mode == MPFR_RNDNA ? mpfr_round(x, x) : mpfr_rint(x, x, mode);
  return true;
}

// The exact number in the format.
inline Answer round(const Format& f, const Number& x, mpfr_rnd_t mode) {
  const Bits sign = mpfr_signbit(x) ? f.sign() : 0;
  if (mpfr_nan_p(x)) return {f.infinity() | f.quiet(), 16};
  if (mpfr_inf_p(x)) return {sign | f.infinity(), 0};
  if (mpfr_zero_p(x)) return {sign, 0};
  Number unbounded(f.precision);  // rounded as if exponents had no bound
  mpfr_set(unbounded, x, mode);
  const long exponent = mpfr_get_exp(unbounded) - 1;
  if (exponent > f.greatest) {
    const bool to_infinity = mode == MPFR_RNDN || mode == (sign ? MPFR_RNDD : MPFR_RNDU);
    return {sign | (to_infinity ? f.infinity() : f.infinity() - 1), 5};
  }
  const bool tiny = exponent < f.least;
  const long quantum = (tiny ? f.least : exponent) - f.precision + 1;
  Number significand;
  mpfr_set(significand, x, MPFR_RNDN);
  const bool inexact = round_to_integer(significand, -quantum, mode);
  mpfr_abs(significand, significand, MPFR_RNDN);
  const Bits integer = mpfr_get_ui(significand, MPFR_RNDN);
  const Bits field = tiny ? 0 : static_cast<Bits>(exponent - f.least);
  return {sign | (field * f.unit() + integer), inexact ? tiny ? 3u : 1u : 0u};
}

}  // namespace exact

#endif
