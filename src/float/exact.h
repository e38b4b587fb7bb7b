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
  Vector<Lane> far;          // in the top bit: lanes that cannot be computed as near
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

// The bits of x, but where x is not 0 and lies more than Gap powers of two below y, a number that lies Gap below.
// Beside y it counts no more than any other: sums with y round alike as long as they keep less than Gap bits. Of
// numbers no farther apart the sum has room in a format of Gap bits more than x has.
template <int Gap>
inline Words apart(Words x, Words y) {
  const auto magnitude = in_bits<Integers>(x & single_magnitude);
  const auto least = in_bits<Integers>((y & Single::infinity) - powers_of_two<Single>(Gap));
  const auto lifted = in_bits<Words>(magnitude < least ? least : magnitude);
  return (x & single_sign) | (lifted & in_bits<Words>(magnitude != 0));
}

// Singles that have been computed, as doubles.
inline ExactDoubles as_doubles(Words singles) {
  alignas(64) float each[step];
  store_register(each, 0, singles);
  return {doubles_at(each), doubles_at(each + half_a_step)};
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

template <class A, class B>
inline auto sum_of_halves(const A& a, const B& b) {
  if constexpr (A::reach == Reach::near) {
    return ExactSingles<Left::none>{a.value() + b.value()};
  } else {
    // (The sum of a power of two and a number that has been lifted, where they differ in sign, may become a tie,
    // between that power and the number below it; it goes to the power, which is right.)
    const Tame x = tame<Half>(words_of(a.value())), y = tame<Half>(words_of(b.value()));
    const auto lifted = [](Words u, Words v) { return in_bits<Singles>(apart<12>(u, v)); };
    return ExactBut<ExactSingles<Left::great>>{{lifted(x.bits, y.bits) + lifted(y.bits, x.bits)}, x.left | y.left};
  }
}

template <class A, class B>
inline auto sum_of_singles(const A& a, const B& b) {
  if constexpr (A::reach == Reach::near) {
    return ExactDoubles{a.lower() + b.lower(), a.upper() + b.upper()};
  } else {
    const Tame x = tame<Single>(a.bits()), y = tame<Single>(b.bits());
    const ExactDoubles u = as_doubles(apart<28>(x.bits, y.bits)), v = as_doubles(apart<28>(y.bits, x.bits));
    return ExactBut<ExactDoubles>{{u.lower + v.lower, u.upper + v.upper}, x.left | y.left};
  }
}

template <class F, class A, class B>
inline auto sum(const A& a, const B& b) {
  if constexpr (A::reach == Reach::measured) {
    // In a format of n bits two numbers of m have room up to n - m - 1 powers of two apart. Halves are also so small
    // that their sum does not overflow.
    using Lane = typename F::lane;
    const auto x = magnitudes<F>(a.bits()), y = magnitudes<F>(b.bits());
    auto far = beyond<Lane>(x - y, powers_of_two<F>(F::bits == 16 ? 12 : 28));
    if constexpr (F::bits == 16) far |= above<F>(x, F::largest - F::unit) | above<F>(y, F::largest - F::unit);
    return Measured<Lane>{far, a.bits() | b.bits()};
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
    return Measured<typename F::lane>{specials<F>(magnitudes<F>(a.bits()), magnitudes<F>(b.bits())), {}};
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

// c + p for the product p of two singles, 48 bits, which has room unless it is the greater by 2^28. Where c is the
// greater by 2^3, of p counts what a single holds and whether there is more, which the last bit says: it lies below all
// that decides how the sum, half of c at the least, is rounded. Where c is the greater by 2^28 not even that counts.
inline Doubles sum_with_product(Doubles c, Doubles p) {
  constexpr std::uint64_t sign = std::uint64_t{1} << 63, power = std::uint64_t{1} << 52;
  const auto c_magnitude = in_bits<DoubleBits>(c) & ~sign, p_magnitude = in_bits<DoubleBits>(p) & ~sign;
  const DoubleBits odd = cut_odd<rest_bits>(p_magnitude, ~DoubleBits{});
  const DoubleBits least = (c_magnitude & ~(power - 1)) - 28 * power;
  const DoubleBits lifted = chosen(sign_masks(odd - least), least, odd) & sign_masks(0 - p_magnitude);
  const DoubleBits kept = chosen(sign_masks(p_magnitude + 3 * power - c_magnitude), lifted, p_magnitude);
  return c + in_bits<Doubles>(kept | (in_bits<DoubleBits>(p) & sign));
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
    const Words p = words_of(in_bits<Singles>(x.bits) * in_bits<Singles>(y.bits));
    const ExactDoubles u = as_doubles(apart<30>(p, c.bits)), v = as_doubles(apart<30>(c.bits, p));
    return ExactBut<ExactDoubles>{{u.lower + v.lower, u.upper + v.upper}, c.left | x.left | y.left};
  }
}

// acc + a * b for singles.
template <class C, class A, class B>
inline auto fused_singles(const C& acc, const A& a, const B& b) {
  if constexpr (C::reach == Reach::near) {
    // From 3 powers of two on the product may be cut; up to 4 there is room for all of it.
    const auto ahead = in_bits<Integers>(headroom<Single>(acc.bits(), a.bits(), b.bits()));
    const auto below = in_bits<Words>(ahead > static_cast<std::int32_t>(powers_of_two<Single>(7) / 2));
    const auto cut = [](Doubles p, DoubleBits masks) {
      return in_bits<Doubles>(cut_odd<rest_bits>(in_bits<DoubleBits>(p), masks));
    };
    return ExactDoubles{acc.lower() + cut(a.lower() * b.lower(), pair_masks<0>(below)),
                        acc.upper() + cut(a.upper() * b.upper(), pair_masks<1>(below))};
  } else {
    const Tame c = tame<Single>(acc.bits()), x = tame<Single>(a.bits()), y = tame<Single>(b.bits());
    const ExactDoubles u = as_doubles(c.bits), v = as_doubles(x.bits), w = as_doubles(y.bits);
    // Where the product is the greater by 2^27, if neither is 0, there is no room.
    const auto zero = [](const Tame& t) { return in_bits<Words>(magnitudes<Single>(t.bits) == 0); };
    const Words too_far = headroom<Single>(c.bits, x.bits, y.bits) + powers_of_two<Single>(27);
    return ExactBut<ExactDoubles>{
        {sum_with_product(u.lower, v.lower * w.lower), sum_with_product(u.upper, v.upper * w.upper)},
        c.left | x.left | y.left | (too_far & ~zero(x) & ~zero(y) & ~zero(c))};
  }
}

template <class F, class C, class A, class B>
inline auto fused(const C& acc, const A& a, const B& b) {
  if constexpr (C::reach == Reach::measured) {
    // Exponents of factors that are not normal do not tell that of the product.
    using Lane = typename F::lane;
    const auto c = acc.bits(), x = a.bits(), y = b.bits(), m = magnitudes<F>(x), n = magnitudes<F>(y);
    const auto least = static_cast<Lane>(F::unit);
    auto far =
        beyond<Lane>(headroom<F>(c, x, y), powers_of_two<F>(F::bits == 16 ? 11 : 26)) | (m - least) | (n - least);
    if constexpr (has_far_specials<F>) far |= specials<F>(m, n, magnitudes<F>(c));
    return Measured<Lane>{far, (x ^ y) | c};
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
