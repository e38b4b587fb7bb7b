// Floating-point arithmetic in integers: every operation on one number, whatever its operands, without
// the host's floating-point unit. Scalars and single lanes compute with it, vectors do where their fast
// paths (vectors.h) meet a lane that is not for them. Each policy is here once: the rounding, the choice
// of a NaN, the flags.
#ifndef KASTARRI_FLOAT_REFERENCE_H
#define KASTARRI_FLOAT_REFERENCE_H

#include <cstdint>
#include <utility>

#include "float/formats.h"

namespace {

// The finite number +-significand * 2^exponent; where bits have been lost, one that lies between it and the next
// significand. The significand leaves the top bit of S free.
template <class S>
struct Number {
  word negative;  // all ones or 0
  int exponent;
  S significand;
  word lost = 0;  // 1 where bits have been lost
};

// Every sum, and every product of halves, has room in a word for all that rounding asks of it; products
// of singles have in two.
template <class F>
using ProductSignificand = std::conditional_t<F::bits == 16, word, std::uint64_t>;

inline int highest_bit(word x) { return 31 ^ __builtin_clz(x); }

// x shifted right by s >= 0, the last bit sticky: 1 when any bit was lost.
template <class S>
inline S shift_right_sticky(S x, int s) {
  if (s >= static_cast<int>(8 * sizeof(S))) return x != 0;
  return static_cast<S>(x >> s) | ((x & ((S{1} << s) - 1)) != 0);
}

// Less than that of any product, lest 0 count as the greater of two numbers.
constexpr int exponent_of_zero = -1000;

// All ones for a number below 0 and for -0, else 0.
template <class F>
constexpr word sign_of(word x) {
  return static_cast<word>(static_cast<std::int32_t>(x << (32 - F::bits)) >> 31);
}

template <class F>
inline Number<word> unpack(word x) {
  const word field = magnitude<F>(x) >> F::fraction_bits;
  const word fraction = x & (F::unit - 1);
  if (__builtin_expect(field == 0, 0))
    return {sign_of<F>(x), fraction == 0 ? exponent_of_zero : F::least_quantum, fraction};
  return {sign_of<F>(x), F::least_quantum + static_cast<int>(field) - 1, fraction | F::unit};
}

// The magnitude with its last Count bits such that to drop them rounds it.
template <int Count>
[[gnu::always_inline]] inline word rounded_up(word magnitude, word negative, Rounding rounding) {
  constexpr word half = word{1} << (Count - 1);
  if (__builtin_expect(rounding == to_nearest, 1)) return magnitude + (half - 1) + (magnitude >> Count & 1);
  if (rounding == ties_away) return magnitude + half;
  return magnitude + (rounding == (negative ? downward : upward) ? 2 * half - 1 : 0);
}

struct Integer {
  word value;
  bool exact;
};

// |x| / 2^quantum as an integer. It must fit.
inline Integer round_at(const Number<word>& x, int quantum, Rounding rounding) {
  const int shift = quantum - x.exponent;
  if (shift <= 0) return {x.significand << -shift, true};
  // Twice the result with a sticky bit below: a half, and more than nothing beyond it.
  const word doubled = shift == 1 ? x.significand << 1 : shift_right_sticky(x.significand, shift - 2);
  return {rounded_up<2>(doubled, x.negative, rounding) >> 2, (doubled & 3) == 0};
}

template <class F>
inline word overflowed(Environment& env, word negative) {
  env.raise(overflow | inexact);
  const bool finite = env.rounding == toward_zero || env.rounding == (negative ? upward : downward);
  return (finite ? F::largest : F::infinity) | (negative & F::sign);
}

// The one rounding step: x in the format F.
template <class F>
[[gnu::always_inline]] inline word round_pack(Environment& env, const Number<word>& x) {
  const word sign = x.negative & F::sign;
  word significand = x.significand;
  if (__builtin_expect(significand == 0, 0)) {
    if (x.lost == 0) return sign;
    significand = 1;  // as well as any that is below the quantum by far
  }
  // All but `dropped` bits are the format's, once the highest is bit 30.
  constexpr int dropped = 30 - F::fraction_bits;
  const int lead = 30 - highest_bit(significand);
  significand = significand << lead | x.lost;
  int above = x.exponent + 30 - lead - F::least_exponent;
  bool tiny = false;
  if (__builtin_expect(static_cast<word>(above) > word{F::greatest_exponent - F::least_exponent}, 0)) {
    if (above > 0) return overflowed<F>(env, x.negative);
    // Tiny: below the least normal number when rounded as if exponents had no bound.
    tiny = above < -1 || rounded_up<dropped>(significand, x.negative, env.rounding) >> 31 == 0;
    significand = shift_right_sticky(significand, -above);
    above = 0;
  }
  const word rounded = rounded_up<dropped>(significand, x.negative, env.rounding);
  // What is kept holds the hidden bit: it adds one to the exponent field, or two when rounding has carried into it, and
  // none for a subnormal.
  const word field = static_cast<word>(above) << F::fraction_bits;
  const word bits = (rounded >> dropped) + field;
  if (__builtin_expect(bits >= F::infinity, 0)) return overflowed<F>(env, x.negative);
  if ((significand & ((word{1} << dropped) - 1)) != 0) env.raise(tiny ? inexact | underflow : inexact);
  return (rounded >> dropped) + (field | sign);
}

// Whether a number has bits enough for the format, and one more, which with what is lost tells how it is rounded.
template <class F>
constexpr bool is_long_enough(word significand) {
  return significand >> (F::fraction_bits + 1) != 0;
}

inline Number<word> upper_word(const Number<std::uint64_t>& x) {
  const auto high = static_cast<word>(x.significand >> 32), low = static_cast<word>(x.significand);
  return {x.negative, x.exponent + 32, high, word{low != 0} | x.lost};
}

template <class F>
inline Number<word> narrowed(const Number<word>& x) {
  return x;
}
template <class F>
inline Number<word> narrowed(const Number<std::uint64_t>& x) {
  const Number<word> upper = upper_word(x);
  if (__builtin_expect(is_long_enough<F>(upper.significand), 1)) return upper;
  const auto low = static_cast<word>(x.significand);
  if (upper.significand == 0 && low >> 31 == 0) return {x.negative, x.exponent, low, x.lost};
  const int lead = upper.significand == 0 ? 31 : 30 - highest_bit(upper.significand);
  const word kept = upper.significand << lead | low >> 1 >> (31 - lead);
  return {x.negative, upper.exponent - lead, kept, word{low << lead != 0} | x.lost};
}

template <class F>
inline word round_pack(Environment& env, const Number<std::uint64_t>& x) {
  return round_pack<F>(env, narrowed<F>(x));
}

// --- NaN ----------------------------------------------------------------------------------------------

template <class F, class... X>
constexpr bool any_nan(X... x) {
  return (is_nan<F>(x) || ...);
}

// The one choice of a NaN: the first operand that is one, made quiet.
template <class F, class... X>
inline word nan_of(Environment& env, X... operands) {
  if ((is_signalling<F>(operands) || ...)) env.raise(invalid);
  word nan = 0;
  (void)((is_nan<F>(operands) && (nan = operands, true)) || ...);
  return nan | F::quiet;
}

template <class F>
inline word invalid_result(Environment& env) {
  env.raise(invalid);
  return F::default_nan;
}

// The number with the other sign; a NaN as it is, for which NaN it was shows in the result.
template <class F>
constexpr word negated(word x) {
  return is_nan<F>(x) ? x : x ^ F::sign;
}

// --- Sums and products --------------------------------------------------------------------------------

// Sums are made of significands that lie as high as S has room for them, below the top bit and one for a carry: of
// numbers of the format, and of products of two. The one of the lesser exponent is shifted to the other's. It loses
// bits only where the other's hidden bit outweighs it by far, so that a difference keeps all but one of the leading
// bits: two more, at least, than the format has; or where the other is subnormal, and what is lost lies below the
// quantum of all results.
template <class S>
constexpr int summand_bits = 8 * sizeof(S) - 2;

template <class F, class S = word>
inline Number<S> summand(word x) {
  constexpr int lift = summand_bits<S> - (F::fraction_bits + 1);
  const Number<word> number = unpack<F>(x);
  return {number.negative, number.exponent - lift, static_cast<S>(number.significand) << lift};
}

template <class F, class P = ProductSignificand<F>>
[[gnu::always_inline]] inline Number<P> product(word a, word b) {
  constexpr int lift = summand_bits<P> / 2 - (F::fraction_bits + 1);
  const Number<word> x = unpack<F>(a), y = unpack<F>(b);
  return {x.negative ^ y.negative, x.exponent + y.exponent - 2 * lift,
          static_cast<P>(x.significand << lift) * (y.significand << lift)};
}

template <class S>
[[gnu::always_inline]] inline Number<S> sum(Number<S> x, Number<S> y, Rounding rounding) {
  using Signed = std::make_signed_t<S>;
  if (x.exponent < y.exponent) std::swap(x, y);
  int apart = x.exponent - y.exponent;
  if (__builtin_expect(apart >= static_cast<int>(8 * sizeof(S)), 0)) {
    y.significand = y.significand != 0;
    apart = 1;
  }
  const word lost = x.lost | y.lost | word{(y.significand & ((S{1} << apart) - 1)) != 0};
  // A difference is x - y - (what y has lost), rounded down, where x is shifted and y is not. In two's complement -y is
  // ~(y - 1) and ~y is -y - 1, and a shift rounds both down: ~((y - 1) >> n) is -y >> n. So 8 - 3, with 3 shifted by 1,
  // is 8 + ~(2 >> 1) = 6, which with its sticky bit stands for 6.5. If y has lost something itself, which is less than
  // 1, then -y less that is rounded down to ~y, and ~(y >> n) serves.
  const auto differ = static_cast<S>(static_cast<Signed>(static_cast<std::int32_t>(x.negative ^ y.negative)));
  const S less = y.lost != 0 ? y.significand : y.significand + differ;
  const S total = x.significand + (static_cast<S>(static_cast<Signed>(less) >> apart) ^ differ);
  if (__builtin_expect(static_cast<Signed>(total) > 0, 1)) return {x.negative, x.exponent, total, lost};
  if (total == 0 && lost == 0) return {differ != 0 ? (rounding == downward ? ~word{0} : 0) : x.negative, x.exponent, 0};
  if (total == 0) return {x.negative, x.exponent, 0, lost};
  return {y.negative, x.exponent, ~total + 1 - lost, lost};
}

template <class F>
[[gnu::always_inline]] inline Number<word> sum_with_product(word acc, const Number<word>& p, Rounding rounding) {
  return sum(p, summand<F>(acc), rounding);
}
// Of a product of two words the upper one will do, unless both summands lose bits or few remain.
template <class F>
[[gnu::always_inline]] inline Number<word> sum_with_product(word acc, const Number<std::uint64_t>& p,
                                                            Rounding rounding) {
  const Number<word> upper = upper_word(p), c = summand<F>(acc);
  if (__builtin_expect(upper.exponent - c.exponent <= summand_bits<word> - (F::fraction_bits + 1), 1)) {
    const Number<word> total = sum(upper, c, rounding);
    if (__builtin_expect(is_long_enough<F>(total.significand), 1)) return total;
  }
  return narrowed<F>(sum(p, summand<F, std::uint64_t>(acc), rounding));
}

// Neither infinite nor NaNs.
template <class F, class... X>
constexpr bool all_finite(X... x) {
  return ((magnitude<F>(x) < F::infinity) && ...);
}

template <class F>
[[gnu::always_inline]] inline word add(Environment& env, word a, word b) {
  if (__builtin_expect(all_finite<F>(a, b), 1))
    return round_pack<F>(env, sum(summand<F>(a), summand<F>(b), env.rounding));
  if (any_nan<F>(a, b)) return nan_of<F>(env, a, b);
  if (is_infinite<F>(a)) return is_infinite<F>(b) && a != b ? invalid_result<F>(env) : a;
  return b;
}

template <class F>
[[gnu::always_inline]] inline word multiply(Environment& env, word a, word b) {
  if (__builtin_expect(all_finite<F>(a, b), 1)) return round_pack<F>(env, product<F>(a, b));
  if (any_nan<F>(a, b)) return nan_of<F>(env, a, b);
  return is_zero<F>(a) || is_zero<F>(b) ? invalid_result<F>(env) : ((a ^ b) & F::sign) | F::infinity;
}

// acc + a * b, rounded once.
template <class F>
[[gnu::always_inline]] inline word multiply_add(Environment& env, word acc, word a, word b) {
  if (__builtin_expect(all_finite<F>(a, b, acc), 1))
    return round_pack<F>(env, sum_with_product<F>(acc, product<F>(a, b), env.rounding));
  if (any_nan<F>(a, b, acc)) return nan_of<F>(env, a, b, acc);
  if (is_infinite<F>(a) || is_infinite<F>(b)) {
    if (is_zero<F>(a) || is_zero<F>(b)) return invalid_result<F>(env);
    const word infinite = ((a ^ b) & F::sign) | F::infinity;
    return is_infinite<F>(acc) && acc != infinite ? invalid_result<F>(env) : infinite;
  }
  return acc;
}

// --- Order --------------------------------------------------------------------------------------------

// A number whose order as an integer is that of x, a NaN aside; -0 comes just below +0.
template <class F>
constexpr auto order(word x) {
  using S = std::make_signed_t<typename F::lane>;
  const auto bits = static_cast<S>(x);
  const auto negative = static_cast<S>(bits >> (F::bits - 1));
  return static_cast<S>(bits ^ (negative & static_cast<S>(F::sign - 1)));
}

template <class F>
inline word minimum(Environment& env, word a, word b) {
  if (any_nan<F>(a, b)) return nan_of<F>(env, a, b);
  return order<F>(a) < order<F>(b) ? a : b;
}

template <class F>
inline word maximum(Environment& env, word a, word b) {
  if (any_nan<F>(a, b)) return nan_of<F>(env, a, b);
  return order<F>(a) < order<F>(b) ? b : a;
}

// The other operand, when just one of a and b is a NaN: a number is worth more than a NaN.
template <class F, class Choose>
inline word number_of(Environment& env, word a, word b, Choose choose) {
  if (is_nan<F>(a) == is_nan<F>(b)) return choose(env, a, b);
  nan_of<F>(env, a, b);  // for its flag
  return is_nan<F>(a) ? b : a;
}

// --- Integers -----------------------------------------------------------------------------------------

// The number with its fraction rounded away. A zero keeps the operand's sign.
template <class F>
inline word to_integral(Environment& env, word x, Rounding rounding, bool tells_inexact) {
  if (is_nan<F>(x)) return nan_of<F>(env, x);
  const auto number = unpack<F>(x);
  if (is_infinite<F>(x) || number.exponent >= 0) return x;
  const Integer integer = round_at(number, 0, rounding);
  if (!integer.exact && tells_inexact) env.raise(inexact);
  return round_pack<F>(env, Number<word>{number.negative, 0, integer.value});
}

// value / 2^scale.
template <class F>
inline word from_integer(Environment& env, std::int64_t value, word scale) {
  const std::uint64_t bits = static_cast<std::uint64_t>(value);
  return round_pack<F>(
      env, Number<std::uint64_t>{value < 0 ? ~word{0} : 0, -static_cast<int>(scale), value < 0 ? -bits : bits});
}

// x * 2^scale truncated, as an integer of that width and signedness; out of range, the bound. A NaN
// counts as positive.
template <class F, int Bits, bool Signed>
inline std::int64_t to_integer(Environment& env, word x, word scale) {
  constexpr std::int64_t high = (std::int64_t{1} << (Signed ? Bits - 1 : Bits)) - 1;
  constexpr std::int64_t low = Signed ? -high - 1 : 0;
  const bool negative = is_negative<F>(x) && !is_nan<F>(x);
  const auto out_of_range = [&] {
    env.raise(invalid);
    return negative ? low : high;
  };
  if (magnitude<F>(x) >= F::infinity) return out_of_range();
  auto number = unpack<F>(x);
  number.exponent += static_cast<int>(scale);
  if (number.significand != 0 && number.exponent + highest_bit(number.significand) >= Bits) return out_of_range();
  const Integer integer = round_at(number, 0, toward_zero);
  const auto absolute = std::int64_t{integer.value};
  const std::int64_t value = negative ? -absolute : absolute;
  if (value < low || value > high) return out_of_range();
  if (!integer.exact) env.raise(inexact);
  return value;
}

// --- Formats ------------------------------------------------------------------------------------------

// The number in the other format. The fraction of a NaN is aligned at its top.
template <class From, class To>
inline word change_format(Environment& env, word x) {
  const word sign = is_negative<From>(x) ? To::sign : 0;
  if (is_nan<From>(x)) {
    const word fraction = nan_of<From>(env, x) & (From::unit - 1);
    constexpr int wider = To::fraction_bits - From::fraction_bits;
    return sign | To::infinity |
           (wider > 0 ? fraction << (wider > 0 ? wider : 0) : fraction >> (wider > 0 ? 0 : -wider));
  }
  if (is_infinite<From>(x)) return sign | To::infinity;
  return round_pack<To>(env, unpack<From>(x));
}

// --- Exponents ----------------------------------------------------------------------------------------

// A number whose exponent has no bearing on the exponent operations: zero, infinity, NaN.
template <class F>
constexpr bool lacks_exponent(word x) {
  return is_zero<F>(x) || magnitude<F>(x) >= F::infinity;
}

// The e of x = +-m * 2^e, 1 <= m < 2; 0 for what lacks one.
template <class F>
inline int exponent_of(word x) {
  if (lacks_exponent<F>(x)) return 0;
  const auto number = unpack<F>(x);
  return number.exponent + highest_bit(number.significand);
}

template <class F>
inline word power_of_two(int exponent) {
  return static_cast<word>(exponent + F::bias) << F::fraction_bits;
}

// x * 2^by, for a by that keeps a significant number exact.
template <class F>
inline word scaled(Environment& env, word x, int by) {
  if (lacks_exponent<F>(x)) return x;
  auto number = unpack<F>(x);
  number.exponent += by;
  return round_pack<F>(env, number);
}

}  // namespace

#endif
