// Wide lanes shifted right and clamped in registers, as words on their way to narrow lanes, by a count that all share
// (a word) or by the lanes' own (a vector of words).
#ifndef KASTARRI_MULTIPLY_SHIFTED_H
#define KASTARRI_MULTIPLY_SHIFTED_H

#include <limits>

#include "frame/arithmetic.h"
#include "frame/layouts.h"
#include "frame/registers.h"
#include "multiply/register_products.h"
#include "multiply/saturated.h"
#include "multiply/scaled.h"

namespace {

// The lower halves of words, sign-extended.
inline Integers lower_halves_extended(Integers v) {
  return sums_of_products(in_bits<Shorts>(v), in_bits<Shorts>(Words{} + 1));
}
// The end of the range of 32 bits on the side of a number whose upper word this is.
inline Integers bound(Integers high) { return (high >> 31) ^ std::numeric_limits<std::int32_t>::max(); }

// --- Roundings -------------------------------------------------------------------------------------------

// By n, a word that all lanes share or a vector of words. With t = x >> (n - 1), x / 2^n rounded half up is (t + 1) >>
// 1, and that is t - (t >> 1), which does not overflow.
struct Rounded {
  static constexpr bool half_up = true;
  template <class N>
  static Integers shifted(Integers x, N n) {
    const Integers twice = shifted_right<std::int32_t>(x, counts_of(n - 1));
    return twice - (twice >> 1);
  }
};
struct Truncated {
  static constexpr bool half_up = false;
  template <class N>
  static Integers shifted(Integers x, N n) {
    return shifted_right<std::int32_t>(x, counts_of(n));
  }
};

// 32 lanes of two words each packed to lanes of type Half. The rule makes a register of words from two registers of the
// accumulator, one word of every pair, block by block.
template <class Half, class Rule>
[[gnu::always_inline]] inline void pack_two_by_two(const word* acc, word* r, Rule rule) {
  const auto words = [acc, rule](int k) {
    return in_bits<Register>(rule(load_register<word>(acc, k), load_register<word>(acc, k + 1)));
  };
  for (int k = 0; k < 64 / register_bytes; ++k)
    store_register(r, k, in_order<word>(pack_words(words(4 * k), words(4 * k + 2), Half{})));
}

// --- Lanes of 24 bits ------------------------------------------------------------------------------------

// Register number k of all lanes, or of every other one.
struct All24 {
  static Words part(const word* acc, int k) { return load_register<word>(acc, k); }
};
template <int First>
struct EveryOther24 {
  static Words part(const word* acc, int k) {
    const auto a = load_register<word>(acc, 2 * k), b = load_register<word>(acc, 2 * k + 1);
    return in_order<std::uint64_t>(every_other_word<First>(a, b));
  }
};

// Shifted by n. To truncate, the lane is moved to the top of its word and shifted back by n + 8. To round, a half,
// which is 2^(n-1) or for n = 0 nothing, is added in the 8 bits of room above the sign-extended lane.
template <class Rounding>
inline Integers shifted24(Words lanes, word n) {
  if constexpr (!Rounding::half_up) return Rounding::shifted(in_bits<Integers>(lanes << 8), n + 8);
  const Integers half = Integers{} + static_cast<std::int32_t>(word{1} << n >> 1);
  return Truncated::shifted(in_bits<Integers>(extended_from_24(lanes)) + half, n);
}
template <class Rounding>
inline Integers shifted24(Words lanes, Words n) {
#if defined __AVX2__
  return Rounding::shifted(in_bits<Integers>(lanes << 8), n + 8);
#else
  return in_bits<Integers>(four_scaled<Rounding>(in_bits<Register>(extended_from_24(lanes)), in_bits<Register>(n)));
#endif
}

// By a count that all lanes share they are shifted block by block and put in order last.
template <class Half, class Rounding, int First>
inline void pack_every_other24(const word* acc, word n, word* r) {
  pack_two_by_two<Half>(acc, r, [n](auto a, auto b) { return shifted24<Rounding>(every_other_word<First>(a, b), n); });
}

// --- Lanes of 48 bits to 16 by one count -----------------------------------------------------------------
// A word of each lane is enough. Count > 16: its bits 16 .. 47, for the low 16 are shifted out. Count <= 16: its bits
// 0 .. 31 if it fits them; if not, it is 2^31 or more, and 2^31 >> 16 is beyond 16 bits already: it saturates.

struct Windows {
  Integers low, high;

  Windows(Words a, Words b)
      : low(in_bits<Integers>(every_other_word<0>(a, b))),
        high(in_bits<Integers>(every_other_word<0>(from_16(a), from_16(b)))) {}

  static Words from_16(Words lanes) { return in_bits<Words>(in_bits<LongWords>(lanes) >> 16); }

  Integers lane_fits_low() const { return lower_halves_extended(high) == high; }
  Integers low_clamped() const { return chosen(lane_fits_low(), low, bound(high)); }
};

template <class Rounding>
inline void pack48(const word* acc, word count, word* r) {
  if (count > 16)
    pack_two_by_two<std::int16_t>(acc, r,
                                  [=](auto a, auto b) { return Rounding::shifted(Windows(a, b).high, count - 16); });
  else if (count > 0)
    pack_two_by_two<std::int16_t>(
        acc, r, [=](auto a, auto b) { return Rounding::shifted(Windows(a, b).low_clamped(), count); });
  else
    pack_two_by_two<std::int16_t>(acc, r, [=](auto a, auto b) { return Windows(a, b).low_clamped(); });
}

// --- Lanes of 48 and 64 bits to 32 -----------------------------------------------------------------------

// The lanes that make register number k of words, in two registers: all lanes, or every other one. `ordered` puts words
// that were taken from both of them in the order of the lanes.
struct Two {
  LongWords first, last;
};
template <int Bits>
struct AllLanes {
  static constexpr int bits = Bits;
  static Two lanes(const word* acc, int k) {
    return {load_register<std::uint64_t>(acc, 2 * k), load_register<std::uint64_t>(acc, 2 * k + 1)};
  }
  static Words ordered(Words v) { return in_order<std::uint64_t>(v); }
  static LongWords lanes_ordered(LongWords v) { return v; }
};
template <int First>
struct EveryOther48 {
  static constexpr int bits = 48;
  static Two lanes(const word* acc, int k) {
    const auto of = [acc](int a, int b) {
      return interleaved<First, std::uint64_t>(load_register<std::uint64_t>(acc, a),
                                               load_register<std::uint64_t>(acc, b));
    };
    return {of(4 * k, 4 * k + 1), of(4 * k + 2, 4 * k + 3)};
  }
  static Words ordered(Words v) { return in_order<word>(v); }
  static LongWords lanes_ordered(LongWords v) { return in_order<std::uint64_t>(v); }
};

#if defined __AVX512BW__
// Half a register of words.
typedef word HalfOfWords __attribute__((vector_size(32)));
template <int Number, std::size_t... I>
inline HalfOfWords half_of(Words v, std::index_sequence<I...>) {
  return __builtin_shufflevector(v, v, (I + 8 * Number)...);
}
template <std::size_t... I>
inline Words joined(HalfOfWords a, HalfOfWords b, std::index_sequence<I...>) {
  return __builtin_shufflevector(a, b, I...);
}

// Eight lanes x of 64 bits by counts n of their own. x / 2^n rounded half up is ((2x >> n) + 1) >> 1 where 2x fits,
// else (x >> n) plus the last bit shifted out, bit n - 1 of x.
template <class Rounding, int Bits>
inline __m512i eight_shifted(LongWords lanes, __m512i n) {
  const auto right = [n](__m512i v) { return _mm512_maskz_srav_epi64(0xFF, v, n); };
  const auto x = in_bits<Register>(Bits == 48 ? extended_from_48(lanes) : lanes);
  if constexpr (!Rounding::half_up)
    return right(x);
  else if constexpr (Bits == 48)
    return _mm512_maskz_srai_epi64(0xFF, right(x + x) + 1, 1);
  else
    return right(x) + (_mm512_maskz_srlv_epi64(0xFF, x, n - 1) & _mm512_set1_epi64(1));
}
inline Two widened(Words n) {
  const auto half = [n](auto number) {
    const auto words = in_bits<__m256i>(half_of<number>(n, std::make_index_sequence<8>()));
    return in_bits<LongWords>(_mm512_maskz_cvtepu32_epi64(0xFF, words));
  };
  return {half(std::integral_constant<int, 0>()), half(std::integral_constant<int, 1>())};
}
inline Two widened(word n) {
  const auto all = in_bits<LongWords>(_mm512_maskz_set1_epi32(0x5555, static_cast<int>(n)));
  return {all, all};
}
template <class Rounding, class Lanes, class N>
inline Integers packed_pairs(Two two, N n) {
  const Two counts = widened(n);
  const auto half = [](LongWords lanes, LongWords by) {
    const auto shifted = eight_shifted<Rounding, Lanes::bits>(Lanes::lanes_ordered(lanes), in_bits<Register>(by));
    return in_bits<HalfOfWords>(_mm512_maskz_cvtsepi64_epi32(0xFF, shifted));
  };
  return in_bits<Integers>(
      joined(half(two.first, counts.first), half(two.last, counts.last), std::make_index_sequence<16>()));
}

// Lanes of 48 bits to 16 by counts of their own, without the detour over words.
template <class Rounding>
inline void pack48_by_counts(const word* acc, const word* counts, word* r) {
  for (int k = 0; k < 4; ++k) {
    const auto given = _mm_loadu_si128(reinterpret_cast<const __m128i*>(counts) + k);
    const __m512i n = _mm512_maskz_cvtepu16_epi64(0xFF, _mm_min_epu16(given, _mm_set1_epi16(32)));
    const __m512i shifted = eight_shifted<Rounding, 48>(load_register<std::uint64_t>(acc, k), n);
    _mm_storeu_si128(reinterpret_cast<__m128i*>(r) + k, _mm512_maskz_cvtsepi64_epi16(0xFF, shifted));
  }
}
#else
// Lanes of two words shifted right by n and clamped to a word: low >> n | high << (32 - n), where high >> n is but its
// sign, else the end of the range. To round, the last bit shifted out is added, unless the word is 2^31 - 1 already.
template <class Rounding, int Bits, class N>
inline Integers shifted_pairs(Words low_words, Words high_words, N n) {
  const Integers high =
      Bits == 48 ? lower_halves_extended(in_bits<Integers>(high_words)) : in_bits<Integers>(high_words);
  const Integers low = in_bits<Integers>(shifted_right<word>(low_words, counts_of(n)) |
                                         shifted_left<word>(in_bits<Words>(high), counts_of(32 - n)));
  const Integers fits = low >> 31 == shifted_right<std::int32_t>(high, counts_of(n));
  if constexpr (!Rounding::half_up) return chosen(fits, low, bound(high));
  const Words raised = in_bits<Words>(low) + (shifted_right<word>(low_words, counts_of(n - 1)) & 1);
  const Integers wraps = low > in_bits<Integers>(raised);
  return chosen(fits, in_bits<Integers>(raised + in_bits<Words>(wraps)), bound(high));
}

template <class Rounding, class Lanes, class N>
inline Integers packed_pairs(Two two, N n) {
  const Words first = in_bits<Words>(two.first), last = in_bits<Words>(two.last);
  return shifted_pairs<Rounding, Lanes::bits>(Lanes::ordered(every_other_word<0>(first, last)),
                                              Lanes::ordered(every_other_word<1>(first, last)), n);
}
#if !defined __AVX2__
template <class Rounding, class Lanes>
inline Integers packed_pairs(Two two, Words n) {
  using Number = std::conditional_t<Lanes::bits == 48, Number48, Number64>;
  return in_bits<Integers>(
      four_scaled<Number, Rounding>(in_bits<Register>(two.first), in_bits<Register>(two.last), in_bits<Register>(n)));
}
#endif
#endif

}  // namespace

#endif
