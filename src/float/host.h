// The host's floating-point unit as a fast path for whole vectors, a register at a time.
//
// Its control word (MXCSR) is the host program's: rounding, and flags that have to be found as they were left.
// To write it, or to read flags that have just been raised, costs more than a whole vector does. So the unit
// computes exactly, in a format with room enough: then no rounding mode counts and no flag is raised. The
// rounding is done afterwards, on the bits of the result, and what it drops tells whether it is inexact.
//
//   halves    are computed as singles, 24 bits, in which every half is a number and the product of two exact;
//   singles   as doubles, 53 bits, in which the product of two is exact;
//   sums      have room there when the exponents of their terms are near; when a lane's are not, the vector
//             is computed again in the long way, in which a term far below the other is lifted (apart).
//
// Lanes for which this does not hold are left to the reference: operands or results that are infinite or
// NaNs, results that overflow or come near, tiny ones that need not be exact. They, and subnormal operands, raise
// the host's flags, so HostFpu puts these back.
#ifndef KASTARRI_FLOAT_HOST_H
#define KASTARRI_FLOAT_HOST_H

#ifndef __AVX512F__

#include <immintrin.h>

#include <algorithm>
#include <type_traits>

#include "float/bits.h"
#include "frame/lanes.h"
#include "frame/packs.h"
#include "frame/registers.h"

namespace {

// What the pointer leads to is unknown before.
template <class Pointer>
inline void pin_operand(Pointer& pointer) {
  asm volatile("" : "+r"(pointer) : : "memory");
}
// The register is computed before.
template <class V>
inline V pinned(V result) {
  asm volatile("" : "+x"(result));
  return result;
}

// While it lives, subnormals are honoured, every exception is masked, and sums of 0 are +0. Afterwards MXCSR is as
// it was before. It is written only where it differs.
// Compilers know nothing of MXCSR and move arithmetic past its writes; they cannot where operands are read through
// pointers, and results pass through registers, that are outputs of assembler statements between the writes: what a
// load yields is unknown before the one write, and a result is known before the other.
class HostFpu {
 public:
  template <class... Pointers>
  explicit HostFpu(Pointers&... operands) : found_(read()) {
    if (__builtin_expect((found_ & ~flags) != all_masked, 0)) write(all_masked);
    (pin_operand(operands), ...);
  }
  ~HostFpu() {
    if (__builtin_expect(read() != found_, 0)) write(found_);
  }
  HostFpu(const HostFpu&) = delete;
  HostFpu& operator=(const HostFpu&) = delete;

 private:
  static constexpr word all_masked = 0x1F80, flags = 0x3F;

  static word read() {
    word mxcsr;
    asm volatile("stmxcsr %0" : "=m"(mxcsr) : : "memory");
    return mxcsr;
  }
  static void write(word mxcsr) { asm volatile("ldmxcsr %0" : : "m"(mxcsr) : "memory"); }

  const word found_;
};

// --- Registers ----------------------------------------------------------------------------------------

using Words = Vector<word>;
using Integers = Vector<std::int32_t>;
using Singles = Vector<float>;
using Doubles = Vector<double>;
using DoubleBits = Vector<std::uint64_t>;

constexpr int step = lanes_in_register<word>;  // lanes that are computed at a time

template <class To, class From>
inline To in_bits(From v) {
  return reinterpret_cast<To>(v);
}
inline Words words_of(Singles x) { return in_bits<Words>(x); }

// Lanes of ones where the sign is set.
inline Words sign_masks(Words x) { return in_bits<Words>(in_bits<Integers>(x) >> 31); }
inline DoubleBits sign_masks(DoubleBits x) { return in_bits<DoubleBits>(in_bits<Vector<std::int64_t>>(x) < 0); }

// Where the mask is set the one, elsewhere the other.
template <class V>
inline V chosen(V mask, V where_set, V elsewhere) {
  return (mask & where_set) | (~mask & elsewhere);
}

// Whether a lane of words, or of halves of words, has its top bit set.
template <class Lane>
inline bool any_sign(Vector<Lane> x) {
  constexpr unsigned tops = sizeof(Lane) == 2 ? 0xAAAAAAAA : 0x88888888;
#ifdef __AVX2__
  return (static_cast<unsigned>(_mm256_movemask_epi8(in_bits<Register>(x))) & tops) != 0;
#else
  return (static_cast<unsigned>(_mm_movemask_epi8(in_bits<Register>(x))) & tops) != 0;
#endif
}

inline bool any_bit(Words x) {
#ifdef __AVX2__
  return _mm256_testz_si256(in_bits<Register>(x), in_bits<Register>(x)) == 0;
#else
  return any_sign<word>(in_bits<Words>(x != 0));
#endif
}

// The first or the last half of the lanes at an address, as doubles.
constexpr int half_a_step = step / 2;
inline Doubles doubles_at(const float* singles) {
#ifdef __AVX2__
  return in_bits<Doubles>(_mm256_cvtps_pd(_mm_loadu_ps(singles)));
#else
  return in_bits<Doubles>(_mm_cvtps_pd(_mm_castpd_ps(_mm_load_sd(reinterpret_cast<const double*>(singles)))));
#endif
}
// Of integers whose bits are the words with those of `turned` turned.
inline Doubles doubles_at(const in_memory<word>* words, word turned) {
  const auto* at = reinterpret_cast<const __m128i*>(words);
  const __m128i turn = _mm_set1_epi32(static_cast<int>(turned));
#ifdef __AVX2__
  return in_bits<Doubles>(_mm256_cvtepi32_pd(_mm_xor_si128(_mm_loadu_si128(at), turn)));
#else
  return in_bits<Doubles>(_mm_cvtepi32_pd(_mm_xor_si128(_mm_loadl_epi64(at), turn)));
#endif
}

// Masks of words as masks of pairs of words: those of the first (Half = 0) or the last half of the lanes.
template <int Half>
inline DoubleBits pair_masks(Words masks) {
  const auto v = in_bits<Register>(masks);
#ifdef __AVX2__
  return in_bits<DoubleBits>(
      _mm256_cvtepi32_epi64(Half == 0 ? _mm256_castsi256_si128(v) : _mm256_extracti128_si256(v, 1)));
#else
  return in_bits<DoubleBits>(Half == 0 ? _mm_unpacklo_epi32(v, v) : _mm_unpackhi_epi32(v, v));
#endif
}

// x shifted right, and what that drops, at the top of a word. By 0 to 32 (more, and nothing is left of the first).
struct Parted {
  Words kept, dropped;
};
#ifdef __AVX2__
inline Parted parted(Words x, Words right) {
  return {shifted_right<word>(x, counts_of(right)), shifted_left<word>(x, counts_of(32 - right))};
}
#else
// Without shifts by a count a lane: the halves of a product with 2^(32 - right), by the number with that exponent, whose
// conversion is exact.
inline Parted parted(Words x, Words right) {
  const Words left = 32 - right;
  const auto number = in_bits<Singles>(((left & 15) + Single::bias) << Single::fraction_bits);
  const auto low_power = in_bits<Words>(__builtin_convertvector(number, Integers));
  const Words by_16 = in_bits<Words>((left & 16) != 0), nothing = in_bits<Words>(right == 0);
  const Words power = chosen(by_16, low_power << 16, low_power);
  const auto products = [](DoubleBits a, DoubleBits b) {
    return in_bits<DoubleBits>(_mm_mul_epu32(in_bits<Register>(a), in_bits<Register>(b)));
  };
  const auto pairs = in_bits<DoubleBits>(x), powers = in_bits<DoubleBits>(power);
  const DoubleBits even = products(pairs, powers), odd = products(pairs >> 32, powers >> 32);
  const auto low = in_bits<Words>((even & 0xFFFFFFFF) | odd << 32);
  const auto high = in_bits<Words>(even >> 32 | (odd & ~std::uint64_t{0xFFFFFFFF}));
  return {chosen(nothing, x, high), low & ~nothing};
}
#endif

// --- Rounding -----------------------------------------------------------------------------------------

constexpr int rest_bits = 29;  // of what a single drops of a double
constexpr word all_of_rest = (word{1} << rest_bits) - 1, half_of_rest = word{1} << (rest_bits - 1);

// Two ways to round: what is added to the bits of a number before its lowest Count are dropped, for bits of a number,
// a carry from its fraction included, count as an integer does; and the greatest of the numbers of rest_bits bits
// that are dropped without rounding up.
struct ToNearest {
  template <int Count>
  Words increment(Words bits) const {
    return (bits >> Count & 1) + ((word{1} << (Count - 1)) - 1);
  }
  Words greatest_down(Words kept, Words) const { return half_of_rest - (kept & 1); }
};

struct ToNearestAway {
  Words greatest_down(Words, Words) const { return Words{} + (half_of_rest - 1); }
};

struct Directed {
  template <int Count>
  Words increment(Words bits) const {
    constexpr word low = (word{1} << Count) - 1;
    return (sign_masks(bits) & (by_sign & low)) ^ (of_positive & low);
  }
  Words greatest_down(Words, Words signs) const {
    return (sign_masks(signs) & (by_sign & all_of_rest)) ^ (~of_positive & all_of_rest);
  }
  // All ones where the sign decides whether numbers are rounded away from 0, and where positive ones are.
  word by_sign, of_positive;
};
// By RoundMode.
constexpr Directed directed[] = {{}, {0, 0}, {~word{0}, ~word{0}}, {~word{0}, 0}};

// `kept` with the rest, rest_bits of it, rounded away.
template <class Mode>
inline Words rounded(Words kept, Words rest, Words signs, const Mode& mode) {
  return kept - in_bits<Words>(in_bits<Integers>(rest) > in_bits<Integers>(mode.greatest_down(kept, signs)));
}

// --- Operands -----------------------------------------------------------------------------------------

// Of sums: `measured` operands tell where they are far apart, `near` ones are not, `any` may be.
enum class Reach { measured, near, any };

// `step` lanes of an operand of layout L, from number `from` on.
template <class L, Reach R, class = typename L::number>
class Lanes;

template <class L, Reach R>
class Lanes<L, R, single_float> {
 public:
  static constexpr Reach reach = R;
  using format = Single;
  Lanes(const void* operand, int from) : at_(static_cast<const in_memory<word>*>(operand) + from) {}
  Words bits() const { return load_register<word>(at_, 0); }
  Singles value() const { return load_register<float>(at_, 0); }
  Doubles lower() const { return doubles_at(singles()); }
  Doubles upper() const { return doubles_at(singles() + half_a_step); }

 private:
  const float* singles() const { return reinterpret_cast<const float*>(at_); }
  const in_memory<word>* at_;
};

// Halves widened.
template <class L, Reach R>
class Lanes<L, R, half_float> {
 public:
  static constexpr Reach reach = R;
  using format = Half;
  Lanes(const void* operand, int from) : at_(static_cast<const in_memory<std::uint16_t>*>(operand) + from) {}
  Vector<std::uint16_t> bits() const { return load_register<std::uint16_t>(at_, 0); }  // of twice as many
  Singles value() const {
    const auto* halves = reinterpret_cast<const __m128i*>(at_);
#ifdef __F16C__
    return in_bits<Singles>(_mm256_cvtph_ps(_mm_loadu_si128(halves)));
#else
    // A half in the low bits of a single is 2^-112 times itself; only the exponent of infinities and NaNs
    // has to be told, which near operands are not.
    const __m128i at_top = _mm_unpacklo_epi16(_mm_setzero_si128(), _mm_loadl_epi64(halves));
    const Words spread = in_bits<Words>(in_bits<Integers>(at_top) >> 3) & 0x8FFFE000;
    if constexpr (R == Reach::near) return in_bits<Singles>(spread) * 0x1p112f;
    const Words special = in_bits<Words>(in_bits<Integers>(spread & single_magnitude) > (word{Half::largest} << 13));
    return in_bits<Singles>(spread | (special & Single::infinity)) * 0x1p112f;
#endif
  }

 private:
  const in_memory<std::uint16_t>* at_;
};

template <class L, Reach R>
class Lanes<L, R, integer> {
 public:
  using lane = typename L::container;
  Lanes(const void* operand, int from) : at_(static_cast<const in_memory<lane>*>(operand) + from) {}
  // Of 16 bits.
  Singles value() const {
    const auto* lanes = reinterpret_cast<const __m128i*>(at_);
#ifdef __AVX2__
    const __m128i all = _mm_loadu_si128(lanes);
    const __m256i words = std::is_signed_v<lane> ? _mm256_cvtepi16_epi32(all) : _mm256_cvtepu16_epi32(all);
#else
    const __m128i at_top = _mm_unpacklo_epi16(_mm_setzero_si128(), _mm_loadl_epi64(lanes));
    const __m128i words = std::is_signed_v<lane> ? _mm_srai_epi32(at_top, 16) : _mm_srli_epi32(at_top, 16);
#endif
    return __builtin_convertvector(in_bits<Integers>(words), Singles);
  }
  // Of 32 bits.
  Doubles lower() const { return doubles(0); }
  Doubles upper() const { return doubles(half_a_step); }

 private:
  Doubles doubles(int from) const {
    const auto* words = reinterpret_cast<const in_memory<word>*>(at_ + from);
    if constexpr (std::is_signed_v<lane>) return doubles_at(words, 0);
    return doubles_at(words, single_sign) + 0x1p31;
  }
  const in_memory<lane>* at_;
};

// An operand with its signs turned.
template <class Operand>
struct Negated {
  static constexpr Reach reach = Operand::reach;
  using format = typename Operand::format;
  auto bits() const { return operand.bits() ^ static_cast<typename format::lane>(format::sign); }
  Singles value() const { return -operand.value(); }
  Doubles lower() const { return -operand.lower(); }
  Doubles upper() const { return -operand.upper(); }

  Operand operand;
};
template <class L, Reach R>
inline Negated<Lanes<L, R>> operator-(const Lanes<L, R>& x) {
  return {x};
}

// --- Exact arithmetic -----------------------------------------------------------------------------------

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

template <class A, class B>
inline auto sum_of_halves(const A& a, const B& b) {
  const Singles x = a.value(), y = b.value();
  if constexpr (A::reach == Reach::near) {
    return ExactSingles<Left::none>{x + y};
  } else {
    // (The sum of a power of two and a number that has been lifted, where they differ in sign, may become a tie, between
    // that power and the number below it; it goes to the power, which is right.)
    const auto lifted = [](Singles u, Singles v) { return in_bits<Singles>(apart<12>(words_of(u), words_of(v))); };
    return ExactSingles<Left::great>{lifted(x, y) + lifted(y, x)};
  }
}

template <class A, class B>
inline ExactDoubles sum_of_singles(const A& a, const B& b) {
  if constexpr (A::reach == Reach::near) {
    return {a.lower() + b.lower(), a.upper() + b.upper()};
  } else {
    const ExactDoubles x = as_doubles(apart<28>(a.bits(), b.bits())), y = as_doubles(apart<28>(b.bits(), a.bits()));
    return {x.lower + y.lower, x.upper + y.upper};
  }
}

template <class F, class A, class B>
inline auto sum(const A& a, const B& b) {
  if constexpr (A::reach == Reach::measured) {
    // In a format of n bits two numbers of m have room up to n - m - 1 powers of two apart. Halves are also so small that
    // their sum does not overflow.
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

// Of acc + a * b: by how much acc is the greater, as exponents tell with fractions for their logarithms. It is at most
// 0.18 too great, and acc and product have exponents whose difference is less than 1 from what it is truly.
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
  const Singles c = acc.value(), p = a.value() * b.value();
  const Words c_bits = words_of(c), p_bits = words_of(p);
  if constexpr (C::reach == Reach::near) {
    // In singles there is room if p, of 22 bits, is at most twice below c; where it is lower, its first 12 do.
    const auto bound = in_bits<Integers>((magnitudes<Single>(p_bits) | (Single::unit - 1)) + Single::unit);
    const auto below = in_bits<Words>(in_bits<Integers>(magnitudes<Single>(c_bits)) > bound);
    return ExactSingles<Left::great_and_tiny>{c + in_bits<Singles>(cut_odd<12>(p_bits, below))};
  } else {
    const auto x = as_doubles(apart<30>(p_bits, c_bits));
    const auto y = as_doubles(apart<30>(c_bits, p_bits));
    return ExactDoubles{x.lower + y.lower, x.upper + y.upper};
  }
}

// acc + a * b for singles.
template <class C, class A, class B>
inline auto fused_singles(const C& acc, const A& a, const B& b) {
  const Doubles lower = a.lower() * b.lower(), upper = a.upper() * b.upper();
  const Words c_bits = acc.bits();
  const auto ahead = in_bits<Integers>(headroom<Single>(c_bits, a.bits(), b.bits()));
  if constexpr (C::reach == Reach::near) {
    // From 3 powers of two on the product may be cut; up to 4 there is room for all of it.
    const auto below = in_bits<Words>(ahead > static_cast<std::int32_t>(powers_of_two<Single>(7) / 2));
    const auto cut = [](Doubles p, DoubleBits masks) {
      return in_bits<Doubles>(cut_odd<rest_bits>(in_bits<DoubleBits>(p), masks));
    };
    return ExactDoubles{acc.lower() + cut(lower, pair_masks<0>(below)), acc.upper() + cut(upper, pair_masks<1>(below))};
  } else {
    // Where the product is the greater by 2^27, if neither is 0, there is no room. (A subnormal acc counts as nearly
    // 2^-126, whose last bit is no higher than its own.)
    const auto zero = [](Words x) { return in_bits<Words>(magnitudes<Single>(x) == 0); };
    const Words too_far = in_bits<Words>(ahead) + powers_of_two<Single>(27);
    return ExactBut<ExactDoubles>{{sum_with_product(acc.lower(), lower), sum_with_product(acc.upper(), upper)},
                           too_far & ~zero(a.bits()) & ~zero(b.bits()) & ~zero(c_bits)};
  }
}

template <class F, class C, class A, class B>
inline auto fused(const C& acc, const A& a, const B& b) {
  if constexpr (C::reach == Reach::measured) {
    // Exponents of factors that are not normal do not tell that of the product.
    using Lane = typename F::lane;
    const auto c = acc.bits(), x = a.bits(), y = b.bits(), m = magnitudes<F>(x), n = magnitudes<F>(y);
    const auto least = static_cast<Lane>(F::unit);
    auto far = beyond<Lane>(headroom<F>(c, x, y), powers_of_two<F>(F::bits == 16 ? 11 : 26)) | (m - least) | (n - least);
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

// A number as it is.
template <class L, Reach R>
inline ExactSingles<Left::great_and_tiny> exact_single_of(const Lanes<L, R>& x) {
  return {x.value()};
}

// The exponent of a number is `Single::bias` less than this.
inline Words biased_exponent(Words magnitude) { return magnitude >> Single::fraction_bits; }
// With the hidden bit; 0 for zero. Of subnormals too, which are too small to tell from other small numbers here.
inline Words significand(Words magnitude) {
  return ((magnitude & (Single::unit - 1)) | Single::unit) & in_bits<Words>(magnitude != 0);
}
inline Words at_most(Words x, std::int32_t bound) {
  const auto signed_x = in_bits<Integers>(x), bounds = Integers{} + bound;
  return in_bits<Words>(signed_x < bounds ? signed_x : bounds);
}

struct Truncated {
  Words integers;
  Words dropped;
  Words left;  // in the top bit
};

// x * 2^scale truncated to an integer of To. Out of range, or a NaN, it is left.
template <class To, class Operand>
inline Truncated truncated(const Operand& x, word scale) {
  constexpr bool is_signed = std::is_signed_v<typename To::container>;
  const Words number = words_of(x.value()), magnitude = number & single_magnitude, negative = sign_masks(number);
  // |x| * 2^scale is the significand, its first bit the word's, times 2^-right.
  const Words right = (Single::bias + 31 - scale) - biased_exponent(magnitude);
  const Words least = is_signed ? Words{} + (33 - To::bits) : chosen(negative, Words{} + 32, Words{} + (32 - To::bits));
  const Parted parts = parted(significand(magnitude) << 8, at_most(right, 32));
  return {(parts.kept ^ negative) - negative, parts.dropped, right - least};
}

struct WholeNumber {
  Words bits, dropped;
};

// x rounded to an integer; from 2^23 on it is one.
template <class Mode, class Operand>
inline WholeNumber integral(const Mode& mode, const Operand& x) {
  const Words number = words_of(x.value()), magnitude = number & single_magnitude, sign = number & single_sign;
  const Words right = (Single::bias + Single::fraction_bits) - biased_exponent(magnitude);
  const Words small = ~sign_masks(right - 1);
  // Of numbers below 2^-5 it is enough that they are not 0.
  const Parted parts = parted(significand(magnitude) & small, at_most(right, rest_bits) & small);
  const Words rest = parts.dropped >> (32 - rest_bits);
  const Singles integer = __builtin_convertvector(in_bits<Integers>(rounded(parts.kept, rest, sign, mode)), Singles);
  return {sign | chosen(small, words_of(integer), magnitude), rest};
}

// --- Results ------------------------------------------------------------------------------------------

// Magnitudes between which a lane has its result: from Least on, or 0, up to Greatest. Others are left.
constexpr word no_bound = ~word{0};
template <word Least, word Greatest>
struct Range {
  static constexpr bool has_outside = Greatest != no_bound;
  static constexpr word greatest = Greatest;
  static constexpr bool holds(word magnitude) { return magnitude <= Greatest && (magnitude >= Least || magnitude == 0); }
};

// Whether magnitudes that have been seen are all in the range.
template <class R>
class Within;
template <word Least, word Greatest>
class Within<Range<Least, Greatest>> {
 public:
#ifdef __AVX2__
  void see(Words magnitudes) {
    if constexpr (Greatest == no_bound) return;
    const auto next = in_bits<Integers>(magnitudes), next_least = in_bits<Integers>(magnitudes + below);
    greatest_ = next > greatest_ ? next : greatest_;
    if constexpr (Least > 0) least_ = next_least < least_ ? next_least : least_;
  }
  bool some_not() const {
    if constexpr (Greatest == no_bound) return false;
    auto outside = greatest_ > static_cast<std::int32_t>(Greatest);
    if constexpr (Least > 0) outside |= least_ < static_cast<std::int32_t>(Least + below);
    return any_bit(in_bits<Words>(outside));
  }

 private:
  // Added to all, it makes 0 the greatest.
  static constexpr word below = 0x7FFFFFFF;
  Integers greatest_ = {}, least_ = Integers{} + INT32_MAX;
#else
  void see(Words magnitudes) {
    if constexpr (Greatest == no_bound) return;
    outside_ |= Greatest - magnitudes;
    if constexpr (Least > 0) outside_ |= (magnitudes - Least) & (0 - magnitudes);
  }
  bool some_not() const { return any_sign<word>(outside_); }

 private:
  Words outside_ = {};
#endif
};

// Results in a format, as the bits of singles, with the magnitudes that tell which of them are left and what has been
// dropped from them.
template <class R, bool Paired = false>
struct Settled {
  using range = R;
  // Whether lanes come register by register within a block, as pairs of registers tell them.
  static constexpr bool paired = Paired;
  Words bits, magnitudes, dropped;
};
inline Words in_lane_order(Words v) { return in_bits<Words>(in_order<std::uint64_t>(bits_of(v))); }

template <class F, Left Which>
using Kept = Range<F::bits == 16 && Which == Left::great_and_tiny ? single_bits_of_power(Half::least_exponent) : 0,
                   Which == Left::none ? no_bound : widened_largest<F>>;

// Singles rounded to halves; singles are not rounded again.
template <class F, Left Which, class Mode>
inline auto settled(const ExactSingles<Which>& x, const Mode& mode) {
  using Result = Settled<Kept<F, Which>>;
  const Words exact = words_of(x.value), magnitude = exact & single_magnitude;
  if constexpr (F::bits == 32) return Result{exact, magnitude, {}};
  constexpr int excess = Single::fraction_bits - Half::fraction_bits;
  constexpr word low = (word{1} << excess) - 1;
  return Result{(exact + mode.template increment<excess>(exact)) & ~low, magnitude, exact & low};
}

// Doubles as their upper words, and the leading bits of them as singles with the rest. Where a number is below the
// normal singles, or among the last few of them, these are not right.
struct Leading {
  static constexpr int of_high = 20;  // bits of the fraction
  static constexpr word rebias = word{1023 - Single::bias} << of_high;
  using range = Range<rebias + (1 << of_high), rebias + (Single::infinity >> 3) - 2>;

  Leading(const Doubles& lower, const Doubles& upper) {
    const Words high = every_other_word<1>(bits_of(lower), bits_of(upper));
    const Words low = every_other_word<0>(bits_of(lower), bits_of(upper));
    magnitude = high & single_magnitude;
    sign = high ^ magnitude;
    const auto rebiased = in_bits<Integers>(magnitude - rebias);
    const auto exponent_and_fraction = in_bits<Words>(rebiased > 0 ? rebiased : Integers{});
    kept = exponent_and_fraction << (Single::fraction_bits - of_high) | low >> rest_bits;
    rest = low & all_of_rest;
  }
  Words magnitude, sign, kept, rest;
};

template <class F, class Mode>
inline auto settled(const ExactDoubles& x, const Mode& mode) {
  const Leading leading(x.lower, x.upper);
  if constexpr (F::bits == 32) {
    const Words bits = rounded(leading.kept, leading.rest, leading.sign, mode) | leading.sign;
    return Settled<Leading::range, true>{in_lane_order(bits), leading.magnitude, leading.rest};
  } else {
    // Infinities and NaNs have to be told; no sum or product of halves is below the normal singles.
    const Words finite = in_bits<Words>(in_bits<Integers>(leading.magnitude) <= std::int32_t{Leading::range::greatest});
    const Words odd = leading.kept | (in_bits<Words>(leading.rest != 0) & 1) | (~finite & Single::infinity);
    return settled<F>(ExactSingles<Left::great_and_tiny>{in_bits<Singles>(in_lane_order(odd | leading.sign))}, mode);
  }
}

template <class F, class Exact, class Mode>
inline auto settled(const ExactBut<Exact>& x, const Mode& mode) {
  auto result = settled<F>(x.value, mode);
  const Words left = sign_masks(x.left);
  result.magnitudes |= (result.paired ? in_lane_order(left) : left) & single_magnitude;
  return result;
}
// A half that is rounded to an integer is a half.
template <class F, class Mode>
inline auto settled(const WholeNumber& x, const Mode&) {
  return Settled<Range<0, widened_largest<F>>>{x.bits, x.bits & single_magnitude, x.dropped};
}

// Where lane i of a step is in the order of pairs.
constexpr int paired_lane(int i) {
  const int pair = i / 2;
  return 2 * (pair % blocks_in_register * 2 + pair / blocks_in_register) + i % 2;
}

// Singles that are halves, of two steps, as halves.
inline Vector<std::uint16_t> narrowed(Words first, Words last) {
#ifdef __F16C__
  const auto eight = [](Words x) { return _mm256_cvtps_ph(in_bits<__m256>(x), 0); };
  return in_bits<Vector<std::uint16_t>>(_mm256_set_m128i(eight(last), eight(first)));
#else
  // 2^-112 times as much has the exponent of a half, and subnormal halves are subnormal singles; signs by themselves.
  const auto unsigned_half = [](Words x) {
    return in_bits<Register>(words_of(in_bits<Singles>(x) * 0x1p-112f) << 1 >> 14);
  };
  const auto pack = [](Register a, Register b) {
    return in_bits<Vector<std::uint16_t>>(pack_words(a, b, std::int16_t{}));
  };
  return pack(unsigned_half(first), unsigned_half(last)) |
         (pack(in_bits<Register>(first), in_bits<Register>(last)) & std::uint16_t{Half::sign});
#endif
}

// --- A whole vector -----------------------------------------------------------------------------------

// What operands measure by the rule, register by register of the format.
template <class F, class... Ls, class Rule, class Use, class... Units>
[[gnu::always_inline]] inline void measure(Rule rule, Use use, const Units*... operands) {
  for (int from = 0; from < std::min({Ls::count...}); from += lanes_in_register<typename F::lane>)
    use(from, rule(Lanes<Ls, Reach::measured>(operands, from)...));
}
template <class F, class... Ls, class Rule, class... Units>
[[gnu::always_inline]] inline bool any_far(Rule rule, const Units*... operands) {
  Vector<typename F::lane> far = {};
  measure<F, Ls...>(
      rule, [&](int, auto measured) { far |= measured.far; }, operands...);
  return any_sign<typename F::lane>(far);
}

// Sums that are 0, rounded downward: -0 but for terms that are both +0.
template <class F, class... Ls, class Rule, class... Units>
[[gnu::always_inline]] inline void turn_zeros(typename F::lane* results, Rule rule, const Units*... operands) {
  measure<F, Ls...>(
      rule,
      [&](int from, auto measured) {
        using Lane = typename F::lane;
        const auto result = load_register<Lane>(results + from, 0);
        const auto zero = in_bits<Vector<Lane>>(magnitudes<F>(result) == 0);
        store_register(results + from, 0, result | (zero & measured.either_sign & static_cast<Lane>(F::sign)));
      },
      operands...);
}

// Results of all lanes by a function that yields a step of them.
template <class R, class OneStep>
[[gnu::always_inline]] inline void every_step(typename R::container* results, OneStep one_step) {
  using Lane = typename R::container;
  for (int from = 0; from < R::count; from += lanes_in_register<Lane>) {
    if constexpr (R::bits == 32) {
      store_register(results + from, 0, pinned(one_step(from)));
    } else if constexpr (std::is_same_v<typename R::number, half_float>) {
      const Words first = one_step(from);
      store_register(results + from, 0, pinned(narrowed(first, one_step(from + step))));
    } else {
      const auto first = in_bits<Register>(one_step(from));
      const auto both = bits_of(pack_words(first, in_bits<Register>(one_step(from + step)), Lane{}));
      store_register(results + from, 0, pinned(in_order<std::uint64_t>(both)));
    }
  }
}

// By the rule, which yields exact numbers.
template <class R, Reach Are, class... Ls, class Mode, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult numbers_on_host(Mode mode, typename R::container* results, Rule rule, const Units*... operands) {
  using F = format_of<R>;
  const auto settled_step = [&](int from) {
    return settled<F>(by_rule(rule, mode, Lanes<Ls, Are>(operands, from)...), mode);
  };
  using Result = decltype(settled_step(0));
  alignas(64) word magnitudes[R::count];
  Within<typename Result::range> within;
  Words dropped = {};
  every_step<R>(results, [&](int from) {
    const Result result = settled_step(from);
    if constexpr (Result::range::has_outside) store_register(magnitudes + from, 0, result.magnitudes);
    within.see(result.magnitudes);
    dropped |= result.dropped;
    return result.bits;
  });
  const word flags = any_bit(dropped) ? word{inexact} : 0;
  if (__builtin_expect(!within.some_not(), 1)) return {flags, false};
  for (int i = 0; i < R::count; ++i) {
    const int at = Result::paired ? i / step * step + paired_lane(i % step) : i;
    if (!Result::range::holds(magnitudes[at])) results[i] = static_cast<typename R::container>(~word{0});
  }
  return {flags, true};
}

template <class R, class... Ls, class Mode, class Rule, class... Units>
[[gnu::noinline, gnu::flatten]] HostResult far_on_host(const Mode& mode, typename R::container* results, Rule rule,
                                                       const Units*... operands) {
  return numbers_on_host<R, Reach::any, Ls...>(mode, results, rule, operands...);
}

// Result lane i = rule(operand lanes i ...) on the unit, exact numbers. The results are apart from the operands.
// Flattened: calls would pass registers through memory.
template <class R, class... Ls, class Mode, class Rule, class... Units>
[[gnu::always_inline, gnu::flatten]] inline HostResult on_host_in(const Mode& mode, typename R::container* results,
                                                                  Rule rule, const Units*... operands) {
  const HostFpu fpu(operands...);
  if constexpr (measures<Rule, Lanes<Ls, Reach::measured>...>) {
    if (__builtin_expect(any_far<format_of<R>, Ls...>(rule, operands...), 0)) {
      // By themselves: what is passed by its address has to be in memory from the beginning.
      Results<R> far;
      const HostResult host = far_on_host<R, Ls...>(mode, far.lane, rule, operands...);
      std::memcpy(results, far.lane, sizeof far.lane);
      return host;
    }
    return numbers_on_host<R, Reach::near, Ls...>(mode, results, rule, operands...);
  } else {
    return numbers_on_host<R, Reach::any, Ls...>(mode, results, rule, operands...);
  }
}

// Numbers times a power of two, truncated to integers.
template <class R, class From, class Units>
[[gnu::flatten]] inline HostResult truncated_on_host(typename R::container* results, word scale, const Units* operand) {
  const HostFpu fpu(operand);
  Words dropped = {}, left = {};
  every_step<R>(results, [&](int from) {
    const Truncated result = truncated<R>(Lanes<From, Reach::any>(operand, from), scale);
    dropped |= result.dropped;
    left |= result.left;
    return result.integers;
  });
  return {any_bit(dropped) ? word{inexact} : 0, any_sign<word>(left)};
}

template <class R, class... Ls, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult on_host(TiesAway, typename R::container* results, Rule rule,
                                                 const Units*... operands) {
  return on_host_in<R, Ls...>(ToNearestAway(), results, rule, operands...);
}
template <class R, class... Ls, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult on_host(Rounding rounding, typename R::container* results, Rule rule, const Units*... operands) {
  if (rounding == to_nearest) return on_host_in<R, Ls...>(ToNearest(), results, rule, operands...);
  const HostResult host = on_host_in<R, Ls...>(directed[rounding & 3], results, rule, operands...);
  if constexpr (measures<Rule, Lanes<Ls, Reach::measured>...>)
    if (rounding == downward) turn_zeros<format_of<R>, Ls...>(results, rule, operands...);
  return host;
}

}  // namespace

#endif

#endif
