// Arithmetic that is exact: halves in singles, singles in doubles. What the host's rounding mode is does not count
// then, and no flag is raised.
#ifndef KASTARRI_FLOAT_EXACT_H
#define KASTARRI_FLOAT_EXACT_H

#include "float/host_fpu.h"
#include "float/host_lanes.h"

namespace {

// Which results are left: those that overflow or come near, and also those but 0 that are below the normal numbers,
// unless these are exact.
enum class Left { none, great, great_and_tiny };

// The exact result, or another number that rounds as it does.
template <Left Which>
struct ExactSingles {
  Singles value;
};
struct ExactDoubles {  // great and tiny ones are left
  Doubles lower, upper;
};
// Also bit 31 of the lanes for which it is neither.
template <class Exact>
struct ExactBut {
  Exact value;
  Words left;
};

// What measured operands of a sum yield.
template <class Lane>
struct Measured {
  // In the top bit: lanes that cannot be computed as near, as exponents tell, and those of them without a 0, which is
  // near to any number.
  Vector<Lane> far, far_without_zero;
  Vector<Lane> either_sign;  // there too: the signs of both terms together
};
template <class T>
constexpr bool is_measured = false;
template <class Lane>
constexpr bool is_measured<Measured<Lane>> = true;
// Whether a rule is a sum.
template <class Rule, class... Operands>
constexpr bool measures = [] {
  if constexpr (std::is_invocable_v<Rule, Operands...>) return is_measured<std::invoke_result_t<Rule, Operands...>>;
  return false;
}();

// Lanes beyond +-limit; no lane is as far off as to come round.
template <class Lane>
inline Vector<Lane> beyond(Vector<Lane> x, word limit) {
  return (static_cast<Lane>(limit) - x) | (static_cast<Lane>(limit) + x);
}

template <class F>
constexpr word powers_of_two(int count) {
  return word(count) << F::fraction_bits;
}
template <class F, class V>
inline V magnitudes(V bits) {
  return bits & static_cast<typename F::lane>(F::sign - 1);
}

// Singles that have been computed, as doubles.
inline ExactDoubles as_doubles(Words singles) {
  alignas(64) float each[step];
  store_register(each, 0, singles);
  return {doubles_at(each), doubles_at(each + half_a_step)};
}

// In the top bit: magnitudes that are not 0.
template <class V>
inline V not_zero(V magnitudes) {
  return 0 - magnitudes;
}
// In the top bit: magnitudes that are greater.
template <class F, class V>
inline V above(V magnitudes, word bound) {
  return static_cast<typename F::lane>(bound) - magnitudes;
}
// In the top bit: infinities and NaNs.
template <class F, class... V>
inline auto specials(V... magnitudes) {
  return (above<F>(magnitudes, F::largest) | ...);
}
// Where no instruction widens halves, near ones must not be special.
#ifdef __F16C__
template <class F>
constexpr bool has_far_specials = false;
#else
template <class F>
constexpr bool has_far_specials = F::bits == 16;
#endif

// Operands of the long way: 0 where they would raise flags of the host, in lanes that are left.
struct Tame {
  Words bits;
  Words left;  // in the top bit
};
template <class F>
inline Tame tame(Words singles) {
  const Words magnitude = singles & single_magnitude;
  Words left = widened_largest<F> - magnitude;
  if constexpr (F::bits == 32) left |= (magnitude - F::unit) & (0 - magnitude);  // subnormal
  return {singles & ~sign_masks(left), left};
}

// x + y, or a number that rounds as it does to 24 bits (of doubles) or 11 (of singles), in every mode. x and y have at
// most 48 bits, or 22. The arithmetic is exact, so it raises no flag.
//
// Let 2^e be the power of two in the greater number. Its bits, and the numbers halfway between two results, are all
// multiples of 2^(e - 50), or 2^(e - 21). So the lesser number may be any other between the same two such multiples:
// what it has below half of that is cut off, with the last bit that is kept as a sticky bit, which is set where that
// cuts anything. Where nothing would be kept it is that half. The sum then has room in 53 bits, or 24. (Where something
// is cut off the lesser is the lesser by far, and at least 2^(e - 1) is left of a difference.)
//
// Example, in decimal, rounded to whole numbers: 1000 + 0.500000123 may be 1000 + 0.51.
template <class V, class Bits>
inline V sum_with_room(V x, V y) {
  using Bit = std::remove_reference_t<decltype(Bits{}[0])>;
  constexpr int fraction_bits = sizeof(Bit) == 8 ? 52 : Single::fraction_bits;
  constexpr Bit one = 1, sign = one << (8 * sizeof(Bit) - 1), unit = one << fraction_bits, powers = sign - unit;
  constexpr Bit bits_of_one = (sign >> 1) - unit;
  const auto bits = [](auto v) { return in_bits<Bits>(v); };
  const auto number = [](Bits v) { return in_bits<V>(v); };

  const Bits swapped = (bits(x) ^ bits(y)) & bits(number(bits(x) & ~sign) < number(bits(y) & ~sign));
  const Bits greater = bits(x) ^ swapped, lesser = bits(y) ^ swapped, power = greater & powers;
  const Bits magnitude = lesser & ~sign, half = power - (fraction_bits - 1) * unit;
  const Bits lifted = chosen(bits(number(magnitude) < number(half + unit)), half, magnitude);
  // For n bits to be cut off, 1 to fraction_bits: 2^n, and 2^n - 1 from the last bits of 2^fraction_bits + 2^n.
  const V cut_power = number(power - (lifted & powers) + (bits_of_one + unit));
  const V shift = V{} + static_cast<decltype(x[0] + 0)>(unit);
  const Bits cut = bits(shift + cut_power) - (bits(shift) + 1);
  const Bits kept = (lifted | ((lifted & cut) + cut)) & ~cut;
  return number(greater) + number((kept & bits(number(magnitude) != 0)) | (lesser & sign));
}
inline ExactDoubles sum_with_room(const ExactDoubles& x, const ExactDoubles& y) {
  return {sum_with_room<Doubles, DoubleBits>(x.lower, y.lower), sum_with_room<Doubles, DoubleBits>(x.upper, y.upper)};
}

template <class A, class B>
inline auto sum_of_halves(const A& a, const B& b) {
  if constexpr (A::reach == Reach::near) {
    return ExactSingles<Left::none>{a.value() + b.value()};
  } else {
    const Tame x = tame<Half>(words_of(a.value())), y = tame<Half>(words_of(b.value()));
    const Singles sum = sum_with_room<Singles, Words>(in_bits<Singles>(x.bits), in_bits<Singles>(y.bits));
    return ExactBut<ExactSingles<Left::great>>{{sum}, x.left | y.left};
  }
}

template <class A, class B>
inline auto sum_of_singles(const A& a, const B& b) {
  if constexpr (A::reach == Reach::near) {
    return ExactDoubles{a.lower() + b.lower(), a.upper() + b.upper()};
  } else {
    const Tame x = tame<Single>(a.bits()), y = tame<Single>(b.bits());
    return ExactBut<ExactDoubles>{sum_with_room(as_doubles(x.bits), as_doubles(y.bits)), x.left | y.left};
  }
}

template <class F, class A, class B>
inline auto sum(const A& a, const B& b) {
  if constexpr (A::reach == Reach::measured) {
    // In a format of n bits two numbers of m have room up to n - m - 1 powers of two apart, and with 0 always. Halves
    // are also so small that their sum does not overflow.
    using Lane = typename F::lane;
    const auto x = magnitudes<F>(a.bits()), y = magnitudes<F>(b.bits());
    const auto far = beyond<Lane>(x - y, powers_of_two<F>(F::bits == 16 ? 12 : 28));
    Vector<Lane> great = {};
    if constexpr (F::bits == 16) great = above<F>(x, F::largest - F::unit) | above<F>(y, F::largest - F::unit);
    return Measured<Lane>{far | great, (far & not_zero(x) & not_zero(y)) | great, a.bits() | b.bits()};
  } else if constexpr (F::bits == 16) {
    return sum_of_halves(a, b);
  } else {
    return sum_of_singles(a, b);
  }
}

template <class F, class A, class B>
inline auto product(const A& a, const B& b) {
  if constexpr (F::bits == 32) {
    return ExactDoubles{a.lower() * b.lower(), a.upper() * b.upper()};
  } else if constexpr (has_far_specials<F> && A::reach == Reach::measured) {
    const auto far = specials<F>(magnitudes<F>(a.bits()), magnitudes<F>(b.bits()));
    return Measured<typename F::lane>{far, far, {}};
  } else {
    return ExactSingles<Left::great_and_tiny>{a.value() * b.value()};
  }
}

// Numbers with the lowest Count bits cut off where the mask is set, and the last that is kept set where that cuts
// anything. Beside a greater number, whose sum with it is rounded two places above at least, they count as before.
template <int Count, class V>
inline V cut_odd(V bits, V mask) {
  const V cut = mask & ((decltype(bits[0] + 0u){1} << Count) - 1);
  return (bits | ((bits & cut) + cut)) & ~cut;
}

// Of acc + a * b, with normal factors: by how many powers of two acc is the greater, as exponents tell with fractions
// for their logarithms. It is more than the difference of exponents less 1, and less than that plus 1.18.
template <class F, class V>
inline V headroom(V acc, V a, V b) {
  return magnitudes<F>(acc) - magnitudes<F>(a) - magnitudes<F>(b) + static_cast<typename F::lane>(F::one);
}

// acc + a * b for halves.
template <class C, class A, class B>
inline auto fused_halves(const C& acc, const A& a, const B& b) {
  if constexpr (C::reach == Reach::near) {
    // In singles there is room if p, of 22 bits, is at most twice below c; where it is lower, its first 12 do.
    const Singles c = acc.value(), p = a.value() * b.value();
    const auto bound = in_bits<Integers>((magnitudes<Single>(words_of(p)) | (Single::unit - 1)) + Single::unit);
    const auto below = in_bits<Words>(in_bits<Integers>(magnitudes<Single>(words_of(c))) > bound);
    return ExactSingles<Left::great_and_tiny>{c + in_bits<Singles>(cut_odd<12>(words_of(p), below))};
  } else {
    const Tame c = tame<Half>(words_of(acc.value()));
    const Tame x = tame<Half>(words_of(a.value())), y = tame<Half>(words_of(b.value()));
    const Singles p = in_bits<Singles>(x.bits) * in_bits<Singles>(y.bits);
    const Singles sum = sum_with_room<Singles, Words>(in_bits<Singles>(c.bits), p);
    return ExactBut<ExactSingles<Left::great_and_tiny>>{{sum}, c.left | x.left | y.left};
  }
}

// acc + a * b for singles.
template <class C, class A, class B>
inline auto fused_singles(const C& acc, const A& a, const B& b) {
  if constexpr (C::reach == Reach::near) {
    // From 3 powers of two on the product may be cut; up to 4 there is room for all of it. (An acc of 0 is never ahead
    // of a product that is a normal number.)
    const auto ahead = in_bits<Integers>(headroom<Single>(acc.bits(), a.bits(), b.bits()));
    const auto below = in_bits<Words>(ahead > static_cast<std::int32_t>(powers_of_two<Single>(7) / 2));
    const auto cut = [](Doubles p, DoubleBits masks) {
      return in_bits<Doubles>(cut_odd<rest_bits>(in_bits<DoubleBits>(p), masks));
    };
    return ExactDoubles{acc.lower() + cut(a.lower() * b.lower(), pair_masks<0>(below)),
                        acc.upper() + cut(a.upper() * b.upper(), pair_masks<1>(below))};
  } else {
    const Tame c = tame<Single>(acc.bits()), x = tame<Single>(a.bits()), y = tame<Single>(b.bits());
    const ExactDoubles u = as_doubles(x.bits), v = as_doubles(y.bits);
    const ExactDoubles p = {u.lower * v.lower, u.upper * v.upper};
    return ExactBut<ExactDoubles>{sum_with_room(as_doubles(c.bits), p), c.left | x.left | y.left};
  }
}

template <class F, class C, class A, class B>
inline auto fused(const C& acc, const A& a, const B& b) {
  if constexpr (C::reach == Reach::measured) {
    // Exponents of factors that are not normal do not tell that of the product.
    using Lane = typename F::lane;
    const auto c = acc.bits(), x = a.bits(), y = b.bits(), m = magnitudes<F>(x), n = magnitudes<F>(y);
    const auto k = magnitudes<F>(c), least = Vector<Lane>{} + static_cast<Lane>(F::unit);
    const auto apart = beyond<Lane>(headroom<F>(c, x, y), powers_of_two<F>(F::bits == 16 ? 11 : 26));
    const auto subnormal = (m - least) | (n - least);
    Vector<Lane> special = {};
    if constexpr (has_far_specials<F>) special = specials<F>(m, n, k);
    const auto without_zero = not_zero(m) & not_zero(n) & ((apart & not_zero(k)) | subnormal);
    return Measured<Lane>{apart | subnormal | special, without_zero | special, (x ^ y) | c};
  } else if constexpr (F::bits == 16) {
    return fused_halves(acc, a, b);
  } else {
    return fused_singles(acc, a, b);
  }
}

// --- Integers -----------------------------------------------------------------------------------------

// An integer divided by a power of two.
template <class L, Reach R>
inline auto scaled_single(const Lanes<L, R>& integers, float unit) {
  if constexpr (L::bits == 32) {
    return ExactDoubles{integers.lower() * double{unit}, integers.upper() * double{unit}};
  } else {
    return ExactSingles<Left::great>{integers.value() * unit};
  }
}

// A number as it is, but of a NaN, which is left, nothing that could be dropped.
template <class L, Reach R>
inline ExactSingles<Left::great_and_tiny> exact_single_of(const Lanes<L, R>& x) {
  if constexpr (L::bits == 16) {
    return {x.value()};
  } else {
    const auto nans = in_bits<Integers>(x.bits() & single_magnitude) > static_cast<std::int32_t>(Single::infinity);
    return {in_bits<Singles>(x.bits() & ~(in_bits<Words>(nans) & (Single::quiet - 1)))};
  }
}

struct Truncated {
  Words integers;
  Words dropped;
  Words left;  // in the top bit
};
struct WholeNumber {
  Words bits, magnitudes;  // the magnitudes are those of what has been rounded
  Words dropped;
};

inline Words ones_where(Integers mask) { return in_bits<Words>(mask); }
inline Integers integers_of(Words x) { return in_bits<Integers>(x); }

inline Words at_most(Words x, std::int32_t bound) {
  const auto bounds = Integers{} + bound;
  return in_bits<Words>(integers_of(x) < bounds ? integers_of(x) : bounds);
}

// --- Halves as integers -------------------------------------------------------------------------------

// Magnitudes of halves times 2^Bits as integers. Those below 2^(10 - Bits), which have a lower bit than that, become 1
// unless they are 0: a bit that only tells of what is dropped. What has no room becomes any.
template <int Bits>
inline Words fixed_point(Words magnitudes) {
  // (What has no room would raise a flag of the host.)
  const Words bounded = at_most(magnitudes, static_cast<std::int32_t>(single_bits_of_power(30 - Bits)));
  const Words whole = ones_where(integers_of(magnitudes) >=
                                 static_cast<std::int32_t>(single_bits_of_power(Half::fraction_bits - Bits)));
  constexpr float scale = 1 << Bits;
  return pinned(integers_toward_zero(in_bits<Singles>(bounded & whole) * scale)) | (0 - (magnitudes & ~whole)) >> 31;
}

// x * 2^scale truncated to an integer of 16 bits. Out of range, or a NaN, it is left.
template <class To, class Operand>
inline Truncated truncated_half(const Operand& x, word scale) {
  static_assert(To::bits == 16);
  const Words bits = pinned(words_of(x.value() * as_float(single_bits_of_power(static_cast<int>(scale)))));
  const Words magnitude = bits & single_magnitude, negative = sign_masks(bits);
  constexpr bool is_signed = std::is_signed_v<typename To::container>;
  const Words all = Words{} + (single_bits_of_power(is_signed ? 15 : 16) - 1);
  const Words greatest = is_signed ? all : chosen(negative, Words{} + (single_bits_of_power(0) - 1), all);
  constexpr int point = Half::fraction_bits;
  const Words fixed = fixed_point<point>(magnitude);
  return {((fixed >> point) ^ negative) - negative, fixed & ((1u << point) - 1), greatest - magnitude};
}

// x rounded to an integer; from 2^10 on it is one.
template <class Mode, class Operand>
inline WholeNumber integral_half(const Mode& mode, const Operand& x) {
  const Words number = pinned(words_of(x.value())), magnitude = number & single_magnitude, sign = number ^ magnitude;
  constexpr int point = 12;
  const Words fixed = fixed_point<point>(magnitude), rest = fixed << (32 - point) >> (32 - rest_bits);
  const Words integer = rounded(fixed >> point, rest, sign, mode);
  return {words_of(__builtin_convertvector(integers_of(integer), Singles)) | sign, magnitude, rest};
}

// --- Singles as integers ------------------------------------------------------------------------------

// The exponent of a number is `Single::bias` less than this.
inline Words biased_exponent(Words magnitude) { return magnitude >> Single::fraction_bits; }
// With the hidden bit; 0 for zero. Of subnormals too, which are too small to tell from other small numbers here.
inline Words significand(Words magnitude) {
  return ((magnitude & (Single::unit - 1)) | Single::unit) & ones_where(magnitude != 0);
}

// x * 2^scale truncated to an integer of To. Out of range, or a NaN, it is left.
template <class To, class Operand>
inline Truncated truncated_single(const Operand& x, word scale) {
  constexpr bool is_signed = std::is_signed_v<typename To::container>;
  const Words number = x.bits(), magnitude = number & single_magnitude, negative = sign_masks(number);
  // |x| * 2^scale is the significand, its first bit the word's, times 2^-right.
  const Words right = (Single::bias + 31 - scale) - biased_exponent(magnitude);
  const Words least = is_signed ? Words{} + (33 - To::bits) : chosen(negative, Words{} + 32, Words{} + (32 - To::bits));
  const Parted parts = parted(significand(magnitude) << 8, at_most(right, 32));
  return {(parts.kept ^ negative) - negative, parts.dropped, right - least};
}

// x rounded to an integer; from 2^23 on it is one.
template <class Mode, class Operand>
inline WholeNumber integral_single(const Mode& mode, const Operand& x) {
  const Words number = x.bits(), magnitude = number & single_magnitude, sign = number ^ magnitude;
  const Words right = (Single::bias + Single::fraction_bits) - biased_exponent(magnitude);
  const Words small = ~sign_masks(right - 1);
  // Of numbers below 2^-5 it is enough that they are not 0.
  const Parted parts = parted(significand(magnitude) & small, at_most(right, rest_bits) & small);
  const Words rest = parts.dropped >> (32 - rest_bits);
  const Words integer = rounded(parts.kept, rest, sign, mode);
  return {sign | chosen(small, words_of(__builtin_convertvector(integers_of(integer), Singles)), magnitude), magnitude,
          rest};
}

template <class To, class Operand>
inline Truncated truncated(const Operand& x, word scale) {
  if constexpr (Operand::format::bits == 16) return truncated_half<To>(x, scale);
  if constexpr (Operand::format::bits == 32) return truncated_single<To>(x, scale);
}
template <class Mode, class Operand>
inline WholeNumber integral(const Mode& mode, const Operand& x) {
  if constexpr (Operand::format::bits == 16) return integral_half(mode, x);
  if constexpr (Operand::format::bits == 32) return integral_single(mode, x);
}

}  // namespace

#endif
