// Lanes clamped to half their width. Processors have single instructions for these that compilers do not find, so this
// is the one place that names them.
#ifndef KASTARRI_FRAME_PACKS_H
#define KASTARRI_FRAME_PACKS_H

#include "frame/registers.h"

namespace {

// Words clamped to halves, halves to bytes, block by block: first those of a, then those of b.
#if defined __AVX512BW__
inline __m512i pack_words(__m512i a, __m512i b, std::int16_t) { return _mm512_packs_epi32(a, b); }
inline __m512i pack_words(__m512i a, __m512i b, std::uint16_t) { return _mm512_packus_epi32(a, b); }
inline __m512i pack_halves(__m512i a, __m512i b, std::int8_t) { return _mm512_packs_epi16(a, b); }
inline __m512i pack_halves(__m512i a, __m512i b, std::uint8_t) { return _mm512_packus_epi16(a, b); }
#endif
#if defined __AVX2__
inline __m256i pack_words(__m256i a, __m256i b, std::int16_t) { return _mm256_packs_epi32(a, b); }
inline __m256i pack_words(__m256i a, __m256i b, std::uint16_t) { return _mm256_packus_epi32(a, b); }
inline __m256i pack_halves(__m256i a, __m256i b, std::int8_t) { return _mm256_packs_epi16(a, b); }
inline __m256i pack_halves(__m256i a, __m256i b, std::uint8_t) { return _mm256_packus_epi16(a, b); }
#else
inline __m128i pack_words(__m128i a, __m128i b, std::int16_t) { return _mm_packs_epi32(a, b); }
// Clamped as signed, half the range lower. Words are far from the range's ends.
inline __m128i pack_words(__m128i a, __m128i b, std::uint16_t) {
  const __m128i half = _mm_set1_epi32(0x8000);
  const __m128i packed = _mm_packs_epi32(_mm_sub_epi32(a, half), _mm_sub_epi32(b, half));
  return _mm_xor_si128(packed, _mm_set1_epi16(-0x8000));
}
inline __m128i pack_halves(__m128i a, __m128i b, std::int8_t) { return _mm_packs_epi16(a, b); }
inline __m128i pack_halves(__m128i a, __m128i b, std::uint8_t) { return _mm_packus_epi16(a, b); }
#endif

}  // namespace

#endif
