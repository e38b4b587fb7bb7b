// Steps of products on whole registers that processors have single instructions for and compilers no expression.
#ifndef KASTARRI_MULTIPLY_REGISTER_PRODUCTS_H
#define KASTARRI_MULTIPLY_REGISTER_PRODUCTS_H

#include <cstdint>

#include "frame/registers.h"

namespace {

#if defined __AVX512BW__
inline Register paired_products(Register a, Register b) { return _mm512_madd_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::int16_t) { return _mm512_mulhi_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::uint16_t) { return _mm512_mulhi_epu16(a, b); }
#elif defined __AVX2__
inline Register paired_products(Register a, Register b) { return _mm256_madd_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::int16_t) { return _mm256_mulhi_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::uint16_t) { return _mm256_mulhi_epu16(a, b); }
#else
inline Register paired_products(Register a, Register b) { return _mm_madd_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::int16_t) { return _mm_mulhi_epi16(a, b); }
inline Register upper_products(Register a, Register b, std::uint16_t) { return _mm_mulhi_epu16(a, b); }
#endif

// Lane i = a[2i] * b[2i] + a[2i + 1] * b[2i + 1]. It wraps if all four factors are -2^15, and only then.
inline Integers sums_of_products(Shorts a, Shorts b) {
  return in_bits<Integers>(paired_products(in_bits<Register>(a), in_bits<Register>(b)));
}

// Lane i = a[i] * b[i] >> 16, signed or not as the lanes are.
template <class Lane>
inline Vector<Lane> upper_halves(Vector<Lane> a, Vector<Lane> b) {
  return in_bits<Vector<Lane>>(upper_products(in_bits<Register>(a), in_bits<Register>(b), Lane{}));
}

// Every bit as at least two of the three have it.
inline Integers majority(Integers a, Integers b, Integers c) {
#if defined __AVX512BW__
  return in_bits<Integers>(
      _mm512_ternarylogic_epi32(in_bits<Register>(a), in_bits<Register>(b), in_bits<Register>(c), 0xE8));
#else
  return (a & b) | ((a | b) & c);
#endif
}

// The low 24 bits of a word, the low 48 of a long word, sign-extended. A product with 1 sign-extends: where a target
// can multiply some lanes and leave the rest, it does so for the upper 16 bits of a word, taken as bytes, or of a long
// word.
inline Words extended_from_24(Words v) {
#if defined __AVX512BW__
  const auto all = in_bits<Register>(v);
  return in_bits<Words>(_mm512_mask_maddubs_epi16(all, 0xAAAAAAAA, _mm512_set1_epi16(1), all));
#else
  return in_bits<Words>(in_bits<Integers>(v << 8) >> 8);
#endif
}
inline LongWords extended_from_48(LongWords v) {
#if defined __AVX512BW__
  const auto all = in_bits<Register>(v);
  return in_bits<LongWords>(_mm512_mask_madd_epi16(all, 0xAAAA, all, _mm512_set1_epi32(1)));
#elif defined __AVX2__
  const auto all = in_bits<Register>(v);
  return in_bits<LongWords>(_mm256_blend_epi32(all, _mm256_madd_epi16(all, _mm256_set1_epi32(1)), 0xAA));
#else
  constexpr std::uint64_t sign = std::uint64_t{1} << 47;
  return ((v & (2 * sign - 1)) ^ sign) - sign;
#endif
}

}  // namespace

#endif
