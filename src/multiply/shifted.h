// Wide lanes shifted right and clamped in registers, as words on their way to narrow lanes, by a count that all share
// (a word) or by the lanes' own (a vector of words).
#ifndef KASTARRI_MULTIPLY_SHIFTED_H
#define KASTARRI_MULTIPLY_SHIFTED_H

#include <limits>

#include "frame/layouts.h"
#include "frame/registers.h"
#include "multiply/saturated.h"
#include "multiply/scaled.h"

namespace {

using Int = Vector<std::int32_t>;
using Word = Vector<word>;

inline Int signed_words(Word v) { return reinterpret_cast<Int>(v); }
inline Word unsigned_words(Int v) { return reinterpret_cast<Word>(v); }
inline Int either(Int where, Int there, Int elsewhere) { return (there & where) | (elsewhere & ~where); }

// The lower halves of words, sign-extended.
inline Int lower_halves_extended(Int v) {
  return sums_of_products(reinterpret_cast<Vector<std::int16_t>>(v),
                          reinterpret_cast<Vector<std::int16_t>>(Word{} + 1));
}
// The number of 32 bits nearest to those of this sign that do not fit.
inline Int bound(Int high) { return (high >> 31) ^ std::numeric_limits<std::int32_t>::max(); }

// --- Roundings -------------------------------------------------------------------------------------------

// By N, a word that all lanes share or a vector of words. Rounded half up, x / 2^n is half of x / 2^(n-1), plus a half.
struct Rounded {
  [[maybe_unused]] static constexpr double added = 0.5;
  template <class N>
  static Int shifted(Int x, N n) {
    const Int twice = shifted_right<std::int32_t>(x, counts_of(n - 1));
    return twice - (twice >> 1);
  }
};
struct Truncated {
  [[maybe_unused]] static constexpr double added = 0;
  template <class N>
  static Int shifted(Int x, N n) {
    return shifted_right<std::int32_t>(x, counts_of(n));
  }
};

// 32 lanes packed to lanes of type Half, by a rule that makes a register of words from two of the accumulator: one of
// every pair of words, block by block.
template <class Half, class Rule>
[[gnu::always_inline]] inline void pack_two_by_two(const word* acc, word* r, Rule rule) {
  const auto words = [acc, rule](int k) {
    return reinterpret_cast<Register>(
        rule(load_register<std::uint8_t>(acc, k), load_register<std::uint8_t>(acc, k + 1)));
  };
  for (int k = 0; k < 64 / register_bytes; ++k)
    store_register(r, k, in_order<word>(bits_of(pack_words(words(4 * k), words(4 * k + 2), Half{}))));
}

// --- Lanes of 24 bits ------------------------------------------------------------------------------------

// Register number k of all lanes, or of every other one.
struct All24 {
  static Word part(const word* acc, int k) { return load_register<word>(acc, k); }
};
template <int First>
struct Alternate24 {
  static Word part(const word* acc, int k) {
    const auto a = load_register<std::uint8_t>(acc, 2 * k), b = load_register<std::uint8_t>(acc, 2 * k + 1);
    return as<word>(bits_of(in_order<std::uint64_t>(bits_of(every_other_word<First>(a, b)))));
  }
};

// A lane at the top of its word is shifted by 8 more, so that 0 is a count like others; or a half is added in the room
// above the lane.
template <class Rounding>
inline Int shifted24(Word lanes, word n) {
  if constexpr (Rounding::added == 0) return Rounding::shifted(signed_words(lanes << 8), n + 8);
  const Int half = Int{} + static_cast<std::int32_t>(word{1} << n >> 1);
  return Truncated::shifted(signed_words(extended_from_24(lanes)) + half, n);
}
template <class Rounding>
inline Int shifted24(Word lanes, Word n) {
#if defined __AVX2__
  return Rounding::shifted(signed_words(lanes << 8), n + 8);
#else
  return reinterpret_cast<Int>(
      four_scaled<Rounding>(reinterpret_cast<__m128i>(lanes << 8), reinterpret_cast<__m128i>(n + 8)));
#endif
}

// By one count the lanes are put in order last.
template <class Half, class Rounding, int First>
inline void pack_alternate24(const word* acc, word n, word* r) {
  pack_two_by_two<Half>(acc, r, [n](auto a, auto b) { return shifted24<Rounding>(every_other_word<First>(a, b), n); });
}

// --- Lanes of 48 bits to 16 by one count -----------------------------------------------------------------
// 32 bits of a lane are enough: for a count up to 16 the low ones, above 16 those without the low 16 bits, of which no
// shift leaves a trace. A lane that does not fit the low 32 bits saturates by any count up to 16.

struct Windows {
  Int low, high;

  Windows(Vector<std::uint8_t> a, Vector<std::uint8_t> b)
      : low(signed_words(every_other_word<0>(a, b))), high(signed_words(every_other_word<0>(from_16(a), from_16(b)))) {}

  static Vector<std::uint8_t> from_16(Vector<std::uint8_t> lanes) { return bits_of(as<std::uint64_t>(lanes) >> 16); }

  Int lane_fits_low() const { return lower_halves_extended(high) == high; }
  Int low_clamped() const { return either(lane_fits_low(), low, bound(high)); }
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

// The lanes of two registers, first and last, that make register number k of words: all lanes, or every other one. Of
// their words, the even and the odd are put in order.
struct Two {
  Vector<std::uint8_t> first, last;
};
template <int Bits>
struct AllLanes {
  static constexpr int bits = Bits;
  static Two lanes(const word* acc, int k) {
    return {load_register<std::uint8_t>(acc, 2 * k), load_register<std::uint8_t>(acc, 2 * k + 1)};
  }
  static Word ordered(Word v) { return as<word>(bits_of(in_order<std::uint64_t>(bits_of(v)))); }
  static Vector<std::uint8_t> lanes_ordered(Vector<std::uint8_t> v) { return v; }
};
template <int First>
struct Alternate48 {
  static constexpr int bits = 48;
  static Two lanes(const word* acc, int k) {
    const auto of = [acc](int a, int b) {
      return bits_of(
          interleaved<First, std::uint64_t>(load_register<std::uint8_t>(acc, a), load_register<std::uint8_t>(acc, b)));
    };
    return {of(4 * k, 4 * k + 1), of(4 * k + 2, 4 * k + 3)};
  }
  static Word ordered(Word v) { return in_order<word>(bits_of(v)); }
  static Vector<std::uint8_t> lanes_ordered(Vector<std::uint8_t> v) { return bits_of(in_order<std::uint64_t>(v)); }
};

#if defined __AVX512BW__
// Half a register of words.
typedef word Half __attribute__((vector_size(32)));
template <int Number, std::size_t... I>
inline Half half_of(Word v, std::index_sequence<I...>) {
  return __builtin_shufflevector(v, v, (I + 8 * Number)...);
}
template <std::size_t... I>
inline Word joined(Half a, Half b, std::index_sequence<I...>) {
  return __builtin_shufflevector(a, b, I...);
}

// Lanes of 64 bits shift as signed and saturate. Rounded half up, x / 2^n is half of 2x / 2^n, plus a half, if there is
// room for 2x; else the last bit shifted out is added.
template <class Rounding, int Bits>
inline __m512i eight_shifted(Vector<std::uint64_t> lanes, __m512i n) {
  const auto right = [n](__m512i v) { return _mm512_maskz_srav_epi64(0xFF, v, n); };
  const auto x = reinterpret_cast<__m512i>(Bits == 48 ? extended_from_48(lanes) : lanes);
  if constexpr (Rounding::added == 0)
    return right(x);
  else if constexpr (Bits == 48)
    return _mm512_maskz_srai_epi64(0xFF, right(x + x) + 1, 1);
  else
    return right(x) + (_mm512_maskz_srlv_epi64(0xFF, x, n - 1) & _mm512_set1_epi64(1));
}
inline Two widened(Word n) {
  const auto half = [n](auto number) {
    const Half words = half_of<number>(n, std::make_index_sequence<8>());
    return bits_of(_mm512_maskz_cvtepu32_epi64(0xFF, reinterpret_cast<__m256i>(words)));
  };
  return {half(std::integral_constant<int, 0>()), half(std::integral_constant<int, 1>())};
}
inline Two widened(word n) {
  const auto all = bits_of(_mm512_maskz_set1_epi32(0x5555, static_cast<int>(n)));
  return {all, all};
}
template <class Rounding, class Lanes, class N>
inline Int packed_pairs(Two two, N n) {
  const Two counts = widened(n);
  const auto half = [](Vector<std::uint8_t> lanes, Vector<std::uint8_t> by) {
    const auto shifted = eight_shifted<Rounding, Lanes::bits>(as<std::uint64_t>(Lanes::lanes_ordered(lanes)),
                                                              reinterpret_cast<__m512i>(by));
    return reinterpret_cast<Half>(_mm512_maskz_cvtsepi64_epi32(0xFF, shifted));
  };
  return signed_words(
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
// The low words of the shifted lanes, bounded where the lanes do not fit them; rounded, a word is raised by the last
// bit shifted out unless it is the largest already.
template <class Rounding, int Bits, class N>
inline Int shifted_pairs(Word low_words, Word high_words, N n) {
  const Int high = Bits == 48 ? lower_halves_extended(signed_words(high_words)) : signed_words(high_words);
  const Int low = signed_words(shifted_right<word>(low_words, counts_of(n)) |
                               shifted_left<word>(unsigned_words(high), counts_of(32 - n)));
  const Int fits = low >> 31 == shifted_right<std::int32_t>(high, counts_of(n));
  if constexpr (Rounding::added == 0) return either(fits, low, bound(high));
  const Word raised = unsigned_words(low) + (shifted_right<word>(low_words, counts_of(n - 1)) & 1);
  const Int wraps = low > signed_words(raised);
  return either(fits, signed_words(raised + unsigned_words(wraps)), bound(high));
}

template <class Rounding, class Lanes, class N>
inline Int packed_pairs(Two two, N n) {
  return shifted_pairs<Rounding, Lanes::bits>(Lanes::ordered(every_other_word<0>(two.first, two.last)),
                                              Lanes::ordered(every_other_word<1>(two.first, two.last)), n);
}
#if !defined __AVX2__
template <class Rounding, class Lanes>
inline Int packed_pairs(Two two, Word n) {
  using Number = std::conditional_t<Lanes::bits == 48, Number48, Number64>;
  return reinterpret_cast<Int>(four_scaled<Number, Rounding>(
      reinterpret_cast<__m128i>(two.first), reinterpret_cast<__m128i>(two.last), reinterpret_cast<__m128i>(n)));
}
#endif
#endif

}  // namespace

#endif
