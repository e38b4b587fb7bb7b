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
// What measured operands of a sum yield.
template <class Lane>
struct Measured {
  Vector<Lane> far;          // in the top bit: lanes that cannot be computed as near; a 0 is near to any number
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

// Bits of a number of F, and of one in the format that sums are computed in.
template <class F>
constexpr int digits = F::fraction_bits + 1;
template <class F>
constexpr int wide_digits = F::bits == 16 ? 24 : 53;
// By how many powers of two a term of so many bits may be the lesser: its last bit has room beside the first of the
// greater one and a carry.
template <class F>
constexpr int room_for(int bits) {
  return wide_digits<F> - bits - 1;
}

template <class F>
constexpr word powers_of_two(int count) {
  return word(count) << F::fraction_bits;
}
template <class F, class V>
inline V magnitudes(V bits) {
  return bits & static_cast<typename F::lane>(F::sign - 1);
}

// In the top bit: lanes beyond +-limit; no lane is as far off as to come round.
template <class V>
inline V beyond(V x, word limit) {
  using Lane = std::remove_reference_t<decltype(x[0])>;
  return (static_cast<Lane>(limit) - x) | (static_cast<Lane>(limit) + x);
}
// In the top bit: magnitudes that are not 0.
template <class V>
inline V not_zero(V magnitudes) {
  return 0 - magnitudes;
}
template <class V>
inline V lesser_of(V x, V y) {
  using Signed = Vector<std::make_signed_t<std::remove_reference_t<decltype(x[0])>>>;
  const auto u = in_bits<Signed>(x), v = in_bits<Signed>(y);
  return in_bits<V>(u < v ? u : v);
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

// --- Sums ---------------------------------------------------------------------------------------------
// Of the lesser of two terms far apart it counts between which of the numbers that decide the rounding the sum lies: it
// may be any other term that leaves the sum there, one that has room. In decimal, rounded to whole numbers:
// 1000 + 0.500000123 may be 1000 + 0.51.

constexpr word powers = Single::infinity;

inline Words ones_where(Integers mask) { return in_bits<Words>(mask); }
inline Integers integers_of(Words x) { return in_bits<Integers>(x); }
inline Words at_least(Words x, Words bound) {
  return chosen(ones_where(integers_of(x) < integers_of(bound)), bound, x);
}
// A magnitude as that of x, whose sign it takes: 0 stays 0.
inline Words in_place_of(Words x, Words magnitude) {
  return (magnitude & ones_where((x & single_magnitude) != 0)) | (x & single_sign);
}

// x, but at least Below powers of two below the power of two in y.
template <int Below>
inline Words lifted(Words x, Words y) {
  return in_place_of(x, at_least(x & single_magnitude, (y & powers) - powers_of_two<Single>(Below)));
}

// A magnitude rounded to odd (Boldo and Melquiond) at a power of two q: cut to a multiple of q and, where that cuts
// anything, made an odd one, so that it lies between the same multiples of 2q as before. It is q, or 2q at least. (Of
// subnormal numbers a bit more is cut.)
inline Words odd_multiple(Words x, Words q) {
  // 2^n for n bits to be cut off.
  const Words excess = q - (x & powers) + (Single::one + powers_of_two<Single>(Single::fraction_bits));
  const Words cut = integers_toward_zero(in_bits<Singles>(at_least(excess, Words{} + Single::one))) - 1;
  return (x | ((x & cut) + cut)) & ~cut;
}

// Singles that have been computed, as an operand.
struct NearSingles {
  static constexpr Reach reach = Reach::near;
  Words bits() const { return singles; }
  Doubles lower() const { return doubles_of<0>(singles); }
  Doubles upper() const { return doubles_of<1>(singles); }

  Words singles;
};

// A sum whose greater term is 2^e or more is rounded at multiples of 2^(e - digits - 1), which are results or halfway
// between two. A lesser term that is nearer to 0 than that may be half of it: 2 * digits + 2 bits, for nothing is
// carried.
template <class F>
constexpr int lift = digits<F> + 2;

template <class A, class B>
inline auto sum_of_halves(const A& a, const B& b) {
  if constexpr (A::reach == Reach::near) {
    return ExactSingles<Left::none>{a.value() + b.value()};
  } else {
    const Words x = words_of(a.value()), y = words_of(b.value());
    const auto number = [](Words v) { return in_bits<Singles>(v); };
    return ExactSingles<Left::great>{number(lifted<lift<Half>>(x, y)) + number(lifted<lift<Half>>(y, x))};
  }
}

template <class A, class B>
inline ExactDoubles sum_of_singles(const A& a, const B& b) {
  if constexpr (A::reach == Reach::near) {
    return ExactDoubles{a.lower() + b.lower(), a.upper() + b.upper()};
  } else {
    const Words x = a.bits(), y = b.bits();
    return sum_of_singles(NearSingles{lifted<lift<Single>>(x, y)}, NearSingles{lifted<lift<Single>>(y, x)});
  }
}

// Whether magnitudes are so far apart that their sum has no room; with 0 it has always.
inline Words far_apart(Words x, Words y) {
  return beyond(x - y, powers_of_two<Single>(room_for<Single>(digits<Single>))) & not_zero(x) & not_zero(y);
}
// Or whether the sum may overflow.
inline Halves far_apart(Halves x, Halves y) {
  const Halves lesser = lesser_of(x, y), greater = x ^ y ^ lesser;
  constexpr word limit = powers_of_two<Half>(room_for<Half>(digits<Half>));
  return ((lesser + static_cast<std::uint16_t>(limit) - greater) & ~(lesser - 1)) |
         above<Half>(greater, Half::largest - Half::unit);
}

template <class F, class A, class B>
inline auto sum(const A& a, const B& b) {
  if constexpr (A::reach == Reach::measured) {
    const auto far = far_apart(magnitudes<F>(a.bits()), magnitudes<F>(b.bits()));
    return Measured<typename F::lane>{far, a.bits() | b.bits()};
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
    return Measured<typename F::lane>{far, {}};
  } else {
    return ExactSingles<Left::great_and_tiny>{a.value() * b.value()};
  }
}

// --- Fused sums ---------------------------------------------------------------------------------------
// c + p, of which the product p = a * b has twice the digits. With 2^e and 2^f the powers of two in c and p, the sum
// has room
//   for all of p where e - f <= room_for(2 * digits), which is 1 for halves, 4 for singles;
//   for its first digits + 1 bits, the last a sticky bit, up to room_for(digits), 12 or 28. They will do from e - f = 2
//     on: what decides the rounding are multiples of 2^(e - digits - 1), the last of these bits is half of that at
//     most.
//   where p is the greater, up to f - e = room_for(digits). Beyond, c may be rounded to odd at 2^(f - 2 * digits), half
//     of p's last bit: 2 * digits + 2 bits with a carry.

// Products with the lowest bits cut off where the mask is set, and the last that is kept set where that cuts anything.
template <class F, class V>
inline V cut_odd(V product, V mask) {
  const V cut = mask & ((decltype(product[0] + 0u){1} << room_for<F>(digits<F>)) - 1);
  return (product | ((product & cut) + cut)) & ~cut;
}

// e - f of numbers whose exponents say it, with fractions for their logarithms. It is more than e - f - 1, and less
// than e - f + 1.18: fractions u and v of the factors count u + v, of which a product of 2 or more has at least 0.82.
template <class F, class V>
inline V headroom(V acc, V a, V b) {
  return magnitudes<F>(acc) - magnitudes<F>(a) - magnitudes<F>(b) + static_cast<typename F::lane>(F::one);
}
// Up to so much, of either sign, there is room; more of singles, and c is the greater by 2^(digits + 2) at least.
template <class F>
constexpr int greatest_headroom = room_for<F>(digits<F>) - 1;

template <class C, class A, class B>
inline auto fused_halves(const C& acc, const A& a, const B& b) {
  const Singles product = a.value() * b.value();
  const Words c = words_of(acc.value()), p = words_of(product);
  const auto sum_of = [](Words x, Words y) {
    return ExactSingles<Left::great_and_tiny>{in_bits<Singles>(x) + in_bits<Singles>(y)};
  };
  if constexpr (C::reach == Reach::near) {
    constexpr word room = powers_of_two<Single>(room_for<Half>(2 * digits<Half>));
    const auto bound = integers_of((magnitudes<Single>(p) | (Single::unit - 1)) + room);
    return sum_of(c, cut_odd<Half>(p, ones_where(integers_of(magnitudes<Single>(c)) > bound)));
  } else {
    const auto is_less = integers_of(magnitudes<Single>(c)) < integers_of(magnitudes<Single>(p));
    const Words swapped = (c ^ p) & ones_where(is_less), greater = c ^ swapped, lesser = p ^ swapped;
    const Words m = magnitudes<Single>(lesser), q = (greater & powers) - powers_of_two<Single>(2 * digits<Half>);
    const Words kept = chosen(ones_where(integers_of(m) < integers_of(q + Single::unit)), q, m);
    return sum_of(greater, in_place_of(lesser, odd_multiple(kept, q)));
  }
}

template <class C, class A, class B>
inline ExactDoubles fused_singles(const C& acc, const A& a, const B& b) {
  const Words c = acc.bits(), x = a.bits(), y = b.bits();
  if constexpr (C::reach == Reach::near) {
    constexpr word room = powers_of_two<Single>(room_for<Single>(2 * digits<Single>));
    const Words below = ones_where(integers_of(headroom<Single>(c, x, y)) > std::int32_t{room});
    const auto cut = [](Doubles p, DoubleBits masks) {
      return in_bits<Doubles>(cut_odd<Single>(in_bits<DoubleBits>(p), masks));
    };
    return ExactDoubles{acc.lower() + cut(a.lower() * b.lower(), pair_masks<0>(below)),
                        acc.upper() + cut(a.upper() * b.upper(), pair_masks<1>(below))};
  } else {
    const Words m = magnitudes<Single>(x), n = magnitudes<Single>(y), k = magnitudes<Single>(c);
    // Unsigned words are compared with their top bits turned: m + n takes all 32, and v - 1 puts 0 above all numbers.
    constexpr word top = Single::sign, ahead = Single::one - powers_of_two<Single>(greatest_headroom<Single>);
    const auto is_less = [](Words v, Words bound) {
      return ones_where(integers_of(v + top) < integers_of(bound + top));
    };
    const auto is_number = [&](Words v) { return is_less(v - 1, Words{} + (Single::infinity - 1)); };
    const Words counts = is_number(m) & is_number(n);  // 0 and infinities stay what they are
    // The power of two in p or the one below it, but none below the normal numbers, beside which c is whole.
    const Words p = m + n - Single::one, power = p & powers & ~sign_masks(p) & counts;
    // Where p is the lesser, 2^-lift of c's power of two, or half of that, in place of it.
    const Words below = is_less(m + n, k + ahead) & counts;
    const Words u = chosen(below, (x & single_sign) | (k & powers) | Single::unit, x);
    const Words v = chosen(below, (y & single_sign) | single_bits_of_power(-lift<Single> - 1), y);
    // (At 2^-50 of p's power of two, two places below 2^-48, as that power may be told too small, c too great.)
    const Words q = power - powers_of_two<Single>(2 * digits<Single> + 2);
    const Words near_c = in_place_of(c, odd_multiple(at_least(k, q + Single::unit), q));
    return fused_singles(NearSingles{near_c}, NearSingles{u}, NearSingles{v});
  }
}

template <class F, class C, class A, class B>
inline auto fused(const C& acc, const A& a, const B& b) {
  if constexpr (C::reach == Reach::measured) {
    // Exponents of factors that are not normal do not tell that of the product.
    using Lane = typename F::lane;
    const auto c = acc.bits(), x = a.bits(), y = b.bits(), m = magnitudes<F>(x), n = magnitudes<F>(y);
    const auto k = magnitudes<F>(c), least = Vector<Lane>{} + static_cast<Lane>(F::unit);
    const auto apart = beyond(headroom<F>(c, x, y), powers_of_two<F>(greatest_headroom<F>)) & not_zero(k);
    const auto factor = lesser_of(m, n);
    auto far = (apart | (factor - least)) & not_zero(factor);
    if constexpr (has_far_specials<F>) far |= specials<F>(m, n, k);
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
