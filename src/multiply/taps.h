// Vectors times coefficients that come in words of the scalar core: one, two or four products a lane. The last operand
// meets the lowest coefficient of the word, the one before it the next, and after the highest comes the lowest again:
//   two operands, two coefficients    a[i] * s1 + b[i] * s0
//   four operands, two coefficients   a[i] * s1 + b[i] * s0 + c[i] * s1 + d[i] * s0
#ifndef KASTARRI_MULTIPLY_TAPS_H
#define KASTARRI_MULTIPLY_TAPS_H

#include "frame/entry.h"
#include "multiply/wide_sums.h"

namespace {

// Coefficients of type Stored in Count words. Lane i uses word i mod Count.
template <class Stored, int Count = 1>
struct Coefficients {
  using stored = Stored;
  static constexpr int words = Count;
  static constexpr int bits = 8 * sizeof(Stored);
  static constexpr int in_a_word = 4 / sizeof(Stored);
};

using s8 = Coefficients<std::int8_t>;
using u8 = Coefficients<std::uint8_t>;
using s8_in_2 = Coefficients<std::int8_t, 2>;
using u8_in_2 = Coefficients<std::uint8_t, 2>;
using s8_in_4 = Coefficients<std::int8_t, 4>;
using u8_in_4 = Coefficients<std::uint8_t, 4>;
using s16 = Coefficients<std::int16_t>;
using u16 = Coefficients<std::uint16_t>;
using s16_in_2 = Coefficients<std::int16_t, 2>;
using u16_in_2 = Coefficients<std::uint16_t, 2>;

// The word in whose bytes a reference to coefficients points: the low two bits of the address are ignored. Compilers
// take references to be aligned, and would not clear those bits if they saw where the address comes from.
inline const word* word_around(const void* reference) {
  auto address = reinterpret_cast<std::uintptr_t>(reference);
  asm("" : "+r"(address));
  return reinterpret_cast<const word*>(address & ~std::uintptr_t{3});
}

// --- Sums of products by pairs -------------------------------------------------------------------------
// Targets multiply neighbouring 16-bit numbers and add the two products in one instruction (sums_of_products). So
// operands are interleaved two by two: a0 b0 a1 b1 ... times x y x y ... makes a0 x + b0 y, a1 x + b1 y ...

// 8-bit coefficients as 16-bit numbers, one of each half of a word: its odd byte, its even byte.
template <class Stored>
inline Shorts odd_bytes(Words words) {
  using Lanes = std::conditional_t<std::is_signed_v<Stored>, Shorts, Halves>;
  return in_bits<Shorts>(in_bits<Lanes>(words) >> 8);
}
template <class Stored>
inline Shorts even_bytes(Words words) {
  return odd_bytes<Stored>(in_bits<Words>(in_bits<Halves>(words) << 8));
}

// The operands of a pair: the one that meets the lower half of a word and the one that meets the upper. Neighbours, but
// for four operands by the four bytes of a word: odd_bytes gives bytes 1 and 3 as a pair, so operands 2 and 0, which
// meet them, are one as well. A single operand has no partner.
template <class C>
constexpr int lower_of(int pair) {
  return C::in_a_word == 4 ? pair + 2 : 2 * pair + 1;
}
template <class C>
constexpr int upper_of(int pair) {
  return C::in_a_word == 4 ? pair : 2 * pair;
}

// Keeps compilers from making the value later, where it is used: until then they would have to keep the two that it is
// made of, more than there are registers for.
inline Bytes made_now(Bytes v) {
  asm("" : "+x"(v));
  return v;
}

// The operands interleaved pair by pair. half[0] has the lanes of the lower half of every block, half[1] of the upper.
template <class L, class C, int Count>
struct Pairs {
  static constexpr int count = (Count + 1) / 2;
  Bytes half[2][count];

  template <class... Operand>
  explicit Pairs(Operand... operand) {
    const Bytes all[] = {dealt(operand)...};
    for (int p = 0; p < count; ++p) {
      const Bytes lower = Count == 1 ? all[0] : all[lower_of<C>(p)], upper = Count == 1 ? Bytes{} : all[upper_of<C>(p)];
      half[0][p] = made_now(interleaved<0, typename L::container>(lower, upper));
      half[1][p] = made_now(interleaved<1, typename L::container>(lower, upper));
    }
  }
};

// Sums of 8-bit lanes: four registers of words come of one of lanes. A signed lane x is taken as 2^8 x, for that is how
// it is extended soonest: interleaved above a byte of 0. The sum is then 2^8 times as large (scale), which puts a
// 24-bit sum at the top of its word, where a shift down extends its sign.
template <class L, class C, int Count, bool = L::bits == 8>
struct Sums {
  static constexpr bool is_signed = std::is_signed_v<typename L::container>;
  static constexpr int scale = is_signed ? 8 : 0;
  static constexpr int pairs = (Count + 1) / 2;
  Shorts coefficients[2];

  explicit Sums(const word* words) {
    const auto all = repeated<C::words>(words);
    if constexpr (C::in_a_word == 4) {
      coefficients[0] = odd_bytes<typename C::stored>(all);
      coefficients[1] = even_bytes<typename C::stored>(all);
    } else {
      coefficients[0] = coefficients[1] = in_bits<Shorts>(all);
    }
  }

  template <int Half>
  static Shorts extended(Bytes v) {
    return in_bits<Shorts>(interleaved<Half, std::uint8_t>(is_signed ? Bytes{} : v, is_signed ? v : Bytes{}));
  }
  template <int Quarter>
  Words sum(const Pairs<L, C, Count>& operands) const {
    Words sum{};
    for (int p = 0; p < pairs; ++p)
      sum += in_bits<Words>(sums_of_products(extended<Quarter % 2>(operands.half[Quarter / 2][p]), coefficients[p]));
    return sum;
  }
};

// A 16-bit lane as a signed one. Of an unsigned lane x it is x - 2^15: flipping the top bit does that.
template <class L>
inline Shorts made_signed(Bytes v) {
  return in_bits<Shorts>(std::is_signed_v<typename L::container> ? in_bits<Halves>(v) : in_bits<Halves>(v) ^ 0x8000);
}

// Sums of 16-bit lanes: four registers of pairs of words come of one of lanes. A coefficient c of 16 bits is split into
// bytes, c = 2^8 odd + even. The sums of products with either part fit a word whatever the signs, and the sum wanted is
// 2^8 by_odd + by_even.
template <class L, class C, int Count>
struct Sums<L, C, Count, false> {
  static constexpr bool is_signed = std::is_signed_v<typename L::container>;
  static constexpr int scale = 0;
  static constexpr int pairs = (Count + 1) / 2;
  static constexpr bool split = C::in_a_word == 2;
  Shorts odd, even;
  Words odd_bias, even_bias;  // 2^15 times the coefficients: what sums of unsigned lanes, taken as x - 2^15, lack

  explicit Sums(const word* words) {
    using stored = typename C::stored;
    const auto all = repeated<C::words>(words);
    odd = odd_bytes<stored>(all);
    even = even_bytes<std::conditional_t<split, std::uint8_t, stored>>(all);
    odd_bias = bias(odd);
    even_bias = bias(even);
  }
  static Words bias(Shorts coefficient) {
    if (is_signed) return Words{};
    const auto half = sums_of_products(coefficient, Shorts{} + 0x4000);
    return in_bits<Words>(half) << (split && pairs == 2 ? 2 : 1);
  }

  template <int Quarter>
  LongWords sum(const Pairs<L, C, Count>& operands) const {
    Words by_odd = odd_bias, by_even = even_bias;
    for (int p = 0; p < pairs; ++p) {
      const auto both = made_signed<L>(operands.half[Quarter / 2][p]);
      if (split || p == 0) by_odd += in_bits<Words>(sums_of_products(both, odd));
      if (split || p == 1) by_even += in_bits<Words>(sums_of_products(both, even));
    }
    if constexpr (split) {
      const auto high = in_bits<Integers>(by_odd);
      const auto low = in_bits<Integers>(by_even);
      return pairs_of_words<Quarter % 2>((by_odd << 8) + by_even, (high + (low >> 8)) >> 24);
    } else {
      const auto sum = by_odd + by_even;
      return pairs_of_words<Quarter % 2>(sum, in_bits<Integers>(sum) >> 31);
    }
  }
};

// Sums of 16-bit lanes by signed coefficients of 16 bits that are not split. The sum of two products fits a word unless
// all four factors are -2^15; a word of coefficients 0x80008000 is left to the sums above.
template <class L, class C, int Count>
struct UnsplitSums {
  static constexpr int scale = 0;
  static constexpr bool is_signed = std::is_signed_v<typename L::container>;
  static constexpr int pairs = (Count + 1) / 2;
  Shorts coefficients;
  LongWords bias;  // as above

  static bool serves(const word* words) {
    bool fit = true;
    for (int i = 0; i < C::words; ++i) fit = fit && words[i] != 0x80008000;
    return fit;
  }

  explicit UnsplitSums(const word* words) : coefficients(in_bits<Shorts>(repeated<C::words>(words))), bias{} {
    if (is_signed) return;
    const auto half = sums_of_products(coefficients, Shorts{} + 0x4000);
    bias = pairs_of_words<0>(in_bits<Words>(half) << pairs, half >> (32 - pairs));
  }

  template <int Quarter>
  LongWords sum(const Pairs<L, C, Count>& operands) const {
    Integers low = sum_of_pair(operands.half[Quarter / 2][0]), sign = low;
    if constexpr (pairs == 2) {
      const auto other = sum_of_pair(operands.half[Quarter / 2][1]);
      const auto all = in_bits<Integers>(in_bits<Words>(low) + in_bits<Words>(other));
      // The sign of the exact sum: that of both terms if theirs agree, else that of the wrapped sum, which then fits.
      sign = majority(low, other, all);
      low = all;
    }
    const auto sum = pairs_of_words<Quarter % 2>(in_bits<Words>(low), sign >> 31);
    return is_signed ? sum : sum + bias;
  }

 private:
  Integers sum_of_pair(Bytes both) const { return sums_of_products(made_signed<L>(both), coefficients); }
};

// Register number k of an operand.
struct Whole {
  const word* image;
  Bytes part(int k) const { return load_register<std::uint8_t>(image, k); }
};

// An operand loaded before it is needed. Where an entry is inlined, its operands are in registers as a rule; loads
// behind a branch would have them stored first, for the way that is hardly ever taken.
struct Loaded {
  Bytes registers[64 / register_bytes];
  template <class Operand>
  explicit Loaded(const Operand& operand) {
    for (int k = 0; k < 64 / register_bytes; ++k) registers[k] = operand.part(k);
  }
  Bytes part(int k) const { return registers[k]; }
};
template <class Operand>
using Held = std::conditional_t<entries_are_inlined, Loaded, const Operand&>;

template <class R, class Kind, class L, class C, class Sums, class... Operands>
[[gnu::always_inline]] inline void put_taps(const Sums& sums, const void* acc, void* r, const Operands&... operands) {
  for (int k = 0; k < 64 / register_bytes; ++k) {
    const Pairs<L, C, sizeof...(Operands)> pairs(operands.part(k)...);
    const auto sum = [&](auto quarter) { return sums.template sum<quarter>(pairs); };
    put_sums<R, Kind, Sums::scale>(sum, 4 * k, acc, r);
  }
}

template <class R, class Kind, class L, class C, class... Operands>
[[gnu::always_inline]] inline void sum_of_held(const void* acc, const word* words, void* r,
                                               const Operands&... operands) {
  if constexpr (L::bits == 16 && C::in_a_word == 2 && std::is_signed_v<typename C::stored>) {
    using Unsplit = UnsplitSums<L, C, sizeof...(Operands)>;
    if (__builtin_expect(Unsplit::serves(words), true))
      return put_taps<R, Kind, L, C>(Unsplit(words), acc, r, operands...);
    if constexpr (!entries_are_inlined)
      asm("" : : : "memory");  // else compilers load what both ways need before the branch, and spill it
  }
  put_taps<R, Kind, L, C>(Sums<L, C, sizeof...(Operands)>(words), acc, r, operands...);
}
template <class R, class Kind, class L, class C, class... Operands>
[[gnu::always_inline]] inline void sum_of_taps(const void* acc, const word* words, void* r,
                                               const Operands&... operands) {
  sum_of_held<R, Kind, L, C>(acc, words, r, Held<Operands>(operands)...);
}

// What a call multiplies: as many vectors of layout L as there are operands, then the words of coefficients.
template <class R, class Kind, class L, class C, class Operands,
          class Coefficients = std::make_index_sequence<C::words>>
struct Taps;

template <std::size_t>
using word_image = const word*;

template <class R, class Kind, class L, class C, std::size_t... V, std::size_t... W>
struct Taps<R, Kind, L, C, std::index_sequence<V...>, std::index_sequence<W...>> {
  [[gnu::always_inline]] static inline void run(const word* acc, word_image<V>... vectors, word_image<W>... words,
                                                word* r) {
    const word all[] = {*words...};
    sum_of_taps<R, Kind, L, C>(acc, all, r, Whole{vectors}...);
  }
};

}  // namespace

#endif
