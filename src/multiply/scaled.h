// SSE2 only: wide lanes shifted right by counts n of their own and clamped to words. SSE2 has no shift by a count a
// lane, so lanes are multiplied by 2^-n in floating point. Before that they are rounded to multiples of 2^n, on their
// bits: then every number on the way is one that a float or a double holds, no exception is raised and the host's
// rounding mode does not count. Compilers make branches of the clamps in a loop over lanes, so this is written out, in
// registers of 128 bits.
#ifndef KASTARRI_MULTIPLY_SCALED_H
#define KASTARRI_MULTIPLY_SCALED_H

#include <emmintrin.h>

#include <cstdint>

namespace {

inline __m128i both(std::uint64_t bits) { return _mm_set1_epi64x(static_cast<long long>(bits)); }
inline __m128d number_of(__m128i bits, double less) { return _mm_sub_pd(_mm_castsi128_pd(bits), _mm_set1_pd(less)); }

// 2^n of two lanes, n from 0 to 32: as a number, by its exponent, and in 64 bits, which it is below the exponent of
// 2^52 in the number 2^52 + 2^n.
struct PowerOfTwo {
  __m128d number;
  __m128i bits;

  explicit PowerOfTwo(__m128i n)
      : number(_mm_castsi128_pd(_mm_slli_epi64(_mm_add_epi64(n, both(1023)), 52))),
        bits(_mm_xor_si128(_mm_castpd_si128(_mm_add_pd(number, _mm_set1_pd(0x1p52))), both(0x4330000000000000))) {}

  __m128i half() const { return _mm_srli_epi64(bits, 1); }  // 0 for 2^0
  __m128i multiple_below(__m128i lanes) const { return _mm_and_si128(lanes, _mm_sub_epi64(_mm_setzero_si128(), bits)); }
};

// A 48-bit lane x, rounded to a multiple of a unit 2^n. With its top bit flipped it is x + 2^47 >= 0, which has room
// for a half unit more; below the exponent of 2^52 that is the number 2^52 + 2^47 + x, and what was added is
// subtracted.
struct Number48 {
  template <class Rounding>
  static __m128d rounded(__m128i lanes, const PowerOfTwo& unit) {
    const __m128i own = _mm_and_si128(lanes, both((std::uint64_t{1} << 48) - 1));
    __m128i above_0 = _mm_xor_si128(own, both(std::uint64_t{1} << 47));
    if (Rounding::half_up) above_0 = _mm_add_epi64(above_0, unit.half());
    return number_of(_mm_or_si128(unit.multiple_below(above_0), both(0x4330000000000000)), 0x1.08p52);
  }
};
// A 64-bit lane x likewise: the sum of two such numbers, one of each word. Lanes of 2^(42+n) and beyond saturate and
// come as that, so that 43 bits from the unit's on hold all sums. A half would not fit beside x: a unit is added
// where x has the bit of a half.
struct Number64 {
  template <class Rounding>
  static __m128d rounded(__m128i lanes, const PowerOfTwo& unit) {
    const __m128i whole = unit.multiple_below(lanes);
    const __m128i low = _mm_or_si128(_mm_and_si128(whole, both(0xFFFFFFFF)), both(0x4330000000000000));
    const __m128i high = _mm_xor_si128(_mm_srli_epi64(whole, 32), both(0x4530000080000000));
    const __m128d bound = _mm_mul_pd(unit.number, _mm_set1_pd(0x1p42));
    const __m128d least = _mm_xor_pd(bound, _mm_set1_pd(-0.0));
    const __m128d near = _mm_min_pd(_mm_max_pd(number_of(high, 0x1.000008p84), least), bound);
    const __m128d number = _mm_add_pd(near, number_of(low, 0x1p52));
    if (!Rounding::half_up) return number;
    const __m128i no_bits = _mm_cmpeq_epi32(_mm_and_si128(lanes, unit.half()), _mm_setzero_si128());
    const __m128i no_half = _mm_and_si128(no_bits, _mm_shuffle_epi32(no_bits, 0xB1));
    return _mm_add_pd(number, _mm_andnot_pd(_mm_castsi128_pd(no_half), unit.number));
  }
};

// Two lanes / 2^n, rounded and clamped, as words in the lower half.
template <class Number, class Rounding>
inline __m128i two_scaled(__m128i lanes, __m128i n) {
  const __m128d number = Number::template rounded<Rounding>(lanes, PowerOfTwo(n));
  const __m128d scaled = _mm_mul_pd(number, _mm_castsi128_pd(_mm_slli_epi64(_mm_sub_epi64(both(1023), n), 52)));
  return _mm_cvttpd_epi32(_mm_min_pd(_mm_max_pd(scaled, _mm_set1_pd(-0x1p31)), _mm_set1_pd(0x1p31 - 1)));
}

// Four lanes likewise.
template <class Number, class Rounding>
inline __m128i four_scaled(__m128i first, __m128i last, __m128i n) {
  const __m128i zero = _mm_setzero_si128();
  return _mm_unpacklo_epi64(two_scaled<Number, Rounding>(first, _mm_unpacklo_epi32(n, zero)),
                            two_scaled<Number, Rounding>(last, _mm_unpackhi_epi32(n, zero)));
}

// The same of four 24-bit lanes, sign-extended, n from 0 to 23, which a float holds.
template <class Rounding>
inline __m128i four_scaled(__m128i words, __m128i n) {
  const __m128i bias = _mm_set1_epi32(127);
  const __m128i unit = _mm_cvttps_epi32(_mm_castsi128_ps(_mm_slli_epi32(_mm_add_epi32(bias, n), 23)));
  if (Rounding::half_up) words = _mm_add_epi32(words, _mm_srli_epi32(unit, 1));
  const __m128i whole = _mm_and_si128(words, _mm_sub_epi32(_mm_setzero_si128(), unit));
  const __m128 scale = _mm_castsi128_ps(_mm_slli_epi32(_mm_sub_epi32(bias, n), 23));
  return _mm_cvttps_epi32(_mm_mul_ps(_mm_cvtepi32_ps(whole), scale));
}

}  // namespace

#endif
