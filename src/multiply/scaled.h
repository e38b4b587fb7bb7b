// SSE2 only: wide lanes shifted right by counts of their own and clamped to words. SSE2 has no shift by a count a lane,
// so x >> n is computed as floor(x * 2^-n) in floating point, rounded half up as floor(x * 2^-n + 0.5). A double holds
// x, 2^-n (made by its exponent), their product and the half exactly. Compilers make branches of the clamps in a loop
// over lanes, so this is written out, in registers of 128 bits.
#ifndef KASTARRI_MULTIPLY_SCALED_H
#define KASTARRI_MULTIPLY_SCALED_H

#include <emmintrin.h>

#include <cstdint>

namespace {

inline __m128i both(std::uint64_t bits) { return _mm_set1_epi64x(static_cast<long long>(bits)); }
inline __m128d number_of(__m128i bits, double less) { return _mm_sub_pd(_mm_castsi128_pd(bits), _mm_set1_pd(less)); }

// A 48-bit lane x as a double. Its bits below the exponent of 2^52 are the number 2^52 + x for x >= 0; with the top bit
// of the lane flipped they are 2^52 + 2^47 + x for either sign. What is added is subtracted.
struct Number48 {
  static __m128d of(__m128i lanes, __m128i) {
    const __m128i own = _mm_and_si128(lanes, both((std::uint64_t{1} << 48) - 1));
    return number_of(_mm_xor_si128(own, both(0x4330800000000000)), 0x1.08p52);
  }
};
// A 64-bit lane is the sum of two such numbers, one of each word. A double has 53 bits: of a lane that is shifted by 12
// or more the low 11 bits do not matter and are cleared; shifted by less, a lane of more than 53 bits saturates.
struct Number64 {
  static __m128d of(__m128i lanes, __m128i counts) {
    const __m128i needed = _mm_or_si128(_mm_cmplt_epi32(counts, _mm_set1_epi32(12)), both(~std::uint64_t{0x7FF}));
    const __m128i seen = _mm_and_si128(lanes, needed);
    const __m128i low = _mm_or_si128(_mm_and_si128(seen, both(0xFFFFFFFF)), both(0x4330000000000000));
    const __m128i high = _mm_xor_si128(_mm_srli_epi64(seen, 32), both(0x4530000080000000));
    return _mm_add_pd(number_of(high, 0x1.000008p84), number_of(low, 0x1p52));
  }
};

// floor(x * 2^-n + added) of two lanes x, clamped, as words in the lower half; Rounding::added is 0.5 or 0. Conversion
// truncates toward zero, so that a negative number that was not whole comes out 1 too great.
template <class Number, class Rounding>
inline __m128i two_scaled(__m128i lanes, __m128i counts) {
  const __m128d number = Number::of(lanes, counts);
  const __m128d scale = _mm_castsi128_pd(_mm_slli_epi64(_mm_sub_epi64(both(1023), counts), 52));
  const __m128d exact = _mm_add_pd(_mm_mul_pd(number, scale), _mm_set1_pd(Rounding::added));
  const __m128d clamped = _mm_min_pd(_mm_max_pd(exact, _mm_set1_pd(-0x1p31)), _mm_set1_pd(0x1p31 - 1));
  const __m128i towards_zero = _mm_cvttpd_epi32(clamped);
  const __m128i above = _mm_castpd_si128(_mm_cmplt_pd(clamped, _mm_cvtepi32_pd(towards_zero)));
  return _mm_add_epi32(towards_zero, _mm_shuffle_epi32(above, 0x08));
}

// Four lanes likewise.
template <class Number, class Rounding>
inline __m128i four_scaled(__m128i first, __m128i last, __m128i counts) {
  const __m128i zero = _mm_setzero_si128();
  return _mm_unpacklo_epi64(two_scaled<Number, Rounding>(first, _mm_unpacklo_epi32(counts, zero)),
                            two_scaled<Number, Rounding>(last, _mm_unpackhi_epi32(counts, zero)));
}

// The same of four words that have a 24-bit lane at their top, which a float holds.
template <class Rounding>
inline __m128i four_scaled(__m128i words, __m128i counts) {
  const __m128 scale = _mm_castsi128_ps(_mm_slli_epi32(_mm_sub_epi32(_mm_set1_epi32(127), counts), 23));
  const __m128 scaled = _mm_mul_ps(_mm_cvtepi32_ps(words), scale);
  const __m128 exact = _mm_add_ps(scaled, _mm_set1_ps(static_cast<float>(Rounding::added)));
  const __m128i towards_zero = _mm_cvttps_epi32(exact);
  return _mm_add_epi32(towards_zero, _mm_castps_si128(_mm_cmplt_ps(exact, _mm_cvtepi32_ps(towards_zero))));
}

}  // namespace

#endif
