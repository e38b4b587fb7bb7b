// Floats register by register: operands as the host's unit takes them, and the rounding of what it has computed. For
// the targets whose instructions do not carry their own rounding.
#ifndef KASTARRI_FLOAT_HOST_LANES_H
#define KASTARRI_FLOAT_HOST_LANES_H

#include <type_traits>

#include "float/bits.h"
#include "frame/intrinsics.h"
#include "frame/layouts.h"
#include "frame/registers.h"

namespace {

using DoubleBits = LongWords;

constexpr int step = lanes_in_register<word>;  // lanes that are computed at a time

inline Words words_of(Singles x) { return in_bits<Words>(x); }

// Lanes of ones where the sign is set.
inline Words sign_masks(Words x) { return in_bits<Words>(in_bits<Integers>(x) >> 31); }

inline bool any_bit(Words x) {
#ifdef __AVX2__
  return _mm256_testz_si256(in_bits<Register>(x), in_bits<Register>(x)) == 0;
#else
  return any_sign<word>(in_bits<Words>(x != 0));
#endif
}

// By the instruction, which has an answer for numbers that have no room in an integer too.
inline Words integers_toward_zero(Singles x) {
#ifdef __AVX2__
  return in_bits<Words>(_mm256_cvttps_epi32(in_bits<__m256>(x)));
#else
  return in_bits<Words>(_mm_cvttps_epi32(in_bits<__m128>(x)));
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
// The same of singles in a register.
template <int Half>
inline Doubles doubles_of(Words singles) {
  const auto v = in_bits<Register>(singles);
#ifdef __AVX2__
  return in_bits<Doubles>(_mm256_cvtps_pd(_mm_castsi128_ps(_mm256_extracti128_si256(v, Half))));
#else
  return in_bits<Doubles>(_mm_cvtps_pd(_mm_castsi128_ps(Half == 0 ? v : _mm_unpackhi_epi64(v, v))));
#endif
}

// And of integers at an address whose bits are the words with those of `turned` turned.
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
// Without shifts by a count a lane: the halves of a product with 2^(32 - right), by the number with that exponent,
// whose conversion is exact.
inline Parted parted(Words x, Words right) {
  const Words left = 32 - right;
  const auto number = in_bits<Singles>(((left & 15) + Single::bias) << Single::fraction_bits);
  const Words low_power = integers_toward_zero(number);
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

// The ways to round the bits of a number, as an integer: a carry out of the fraction is right in the exponent. Each has
// two forms, for bits that are dropped from a word and for bits that are beside it:
//
//   increment<Count>(bits) is added before the lowest Count bits are dropped. To nearest, of 2 bits beside an even
//   number, it is 1: binary 10.10, a tie, becomes 10.11 and is cut to 10; 10.11 becomes 11.00.
//
//   greatest_down(kept, signs) is the greatest rest, of rest_bits bits, that is dropped without adding 1 to what is
//   kept: to nearest a half, or the number below it beside an odd number.
//
// (To nearest with ties away rounds to integers alone, which take the second form.)
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
    // A half in the low bits of a single is 2^-112 times itself. That is a subnormal single where the half is one,
    // which processors are slow to multiply, and in place of infinities and NaNs it is a number: where any are looked
    // for, the one has its power of two added and taken away again, and the others their exponent.
    const __m128i at_top = _mm_unpacklo_epi16(_mm_setzero_si128(), _mm_loadl_epi64(halves));
    const Words spread = in_bits<Words>(in_bits<Integers>(at_top) >> 3) & 0x8FFFE000;
    if constexpr (R == Reach::near) {
      return in_bits<Singles>(spread) * 0x1p112f;
    } else {
      constexpr word rebias = word{Single::bias - Half::bias} << Single::fraction_bits;
      constexpr word least_normal = single_bits_of_power(Half::least_exponent);
      const Words magnitude = spread & single_magnitude, sign = spread ^ magnitude;
      const Words small = in_bits<Words>(in_bits<Integers>(magnitude) < static_cast<std::int32_t>(Single::unit));
      const Words special = in_bits<Words>(in_bits<Integers>(magnitude) > (word{Half::largest} << 13));
      const Words normal = magnitude + rebias + (special & rebias);
      const Singles subnormal = in_bits<Singles>(magnitude | least_normal) - as_float(least_normal);
      return in_bits<Singles>(chosen(small, words_of(subnormal), normal) | sign);
    }
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

}  // namespace

#endif
