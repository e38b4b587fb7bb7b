// Wide registers and their spill image, 1536 bits without padding: lane k of w bits is bits wk .. wk + w - 1.
#ifndef KASTARRI_FRAME_SPILL_H
#define KASTARRI_FRAME_SPILL_H

#include "frame/intrinsics.h"
#include "frame/lanes.h"

namespace {

using word_in_memory = in_memory<word>;

// 12 bytes, the low ones of x, as four lanes of 24 bits, sign-extended. Compilers see no shuffle in the
// loop over lanes, so it is said in vector instructions.
inline __m128i widen_24(__m128i x) {
#if defined __SSSE3__
  const __m128i spread = _mm_setr_epi8(-1, 0, 1, 2, -1, 3, 4, 5, -1, 6, 7, 8, -1, 9, 10, 11);
  return _mm_srai_epi32(_mm_shuffle_epi8(x, spread), 8);
#else
  const __m128i pairs = _mm_unpacklo_epi64(x, _mm_srli_si128(x, 6));  // 48 bits in each half
  const __m128i even = _mm_set_epi32(0, -1, 0, -1);
  const __m128i top =
      _mm_or_si128(_mm_and_si128(even, _mm_slli_epi64(pairs, 8)), _mm_andnot_si128(even, _mm_slli_epi64(pairs, 16)));
  return _mm_srai_epi32(top, 8);
#endif
}

// The other way round, with 4 bytes of zeros above.
inline __m128i narrow_24(__m128i x) {
#if defined __SSSE3__
  return _mm_shuffle_epi8(x, _mm_setr_epi8(0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, -1, -1, -1, -1));
#else
  const __m128i low24 = _mm_set_epi32(0, 0xFFFFFF, 0, 0xFFFFFF);
  const __m128i pairs =
      _mm_or_si128(_mm_and_si128(low24, x), _mm_and_si128(_mm_slli_epi64(low24, 24), _mm_srli_epi64(x, 8)));
  const __m128i first = _mm_set_epi32(0, 0, 0xFFFF, -1);
  return _mm_or_si128(_mm_and_si128(first, pairs), _mm_srli_si128(_mm_andnot_si128(first, pairs), 2));
#endif
}

inline __m128i load_bytes(const void* from) { return _mm_loadu_si128(static_cast<const __m128i*>(from)); }
inline void store_bytes(void* to, __m128i x) { _mm_storeu_si128(static_cast<__m128i*>(to), x); }

template <class From>
inline void spill(const void* from, void* to) {
  static_assert(From::bits == 24 || From::bits == 48);
  if constexpr (From::bits == 24) {
    const auto* lanes_in = static_cast<const unsigned char*>(from);
    auto* image = static_cast<unsigned char*>(to);
    // Each store also clears the 4 bytes after its own 12, which the next one fills; the last has none.
    for (int g = 0; g < 15; ++g) store_bytes(image + 12 * g, narrow_24(load_bytes(lanes_in + 16 * g)));
    const __m128i last = narrow_24(load_bytes(lanes_in + 240));
    _mm_storel_epi64(reinterpret_cast<__m128i*>(image + 180), last);
    *reinterpret_cast<word_in_memory*>(image + 188) = static_cast<word>(_mm_cvtsi128_si32(_mm_srli_si128(last, 8)));
  } else {
    // Named types: `auto` would forget that they lie at any address.
    const word_in_memory* source = static_cast<const word_in_memory*>(from);
    word_in_memory* image = static_cast<word_in_memory*>(to);
    KASTARRI_LANES_INDEPENDENT
    for (int g = 0; g < 16; ++g) {
      const word low0 = source[4 * g], high0 = source[4 * g + 1], low1 = source[4 * g + 2], high1 = source[4 * g + 3];
      image[3 * g] = low0;
      image[3 * g + 1] = (high0 & 0xFFFF) | low1 << 16;
      image[3 * g + 2] = low1 >> 16 | high1 << 16;
    }
  }
}

template <class To>
inline void unspill(const void* from, void* to) {
  static_assert(To::bits == 24 || To::bits == 48);
  if constexpr (To::bits == 24) {
    const auto* image = static_cast<const unsigned char*>(from);
    auto* lanes_out = static_cast<unsigned char*>(to);
    for (int g = 0; g < 15; ++g) store_bytes(lanes_out + 16 * g, widen_24(load_bytes(image + 12 * g)));
    store_bytes(lanes_out + 240, widen_24(_mm_srli_si128(load_bytes(image + 176), 4)));
  } else {
    const word_in_memory* image = static_cast<const word_in_memory*>(from);
    word_in_memory* target = static_cast<word_in_memory*>(to);
    const auto extended = [](word w) { return static_cast<word>(static_cast<std::int16_t>(w)); };
    KASTARRI_LANES_INDEPENDENT
    for (int g = 0; g < 16; ++g) {
      const word w0 = image[3 * g], w1 = image[3 * g + 1], w2 = image[3 * g + 2];
      target[4 * g] = w0;
      target[4 * g + 1] = extended(w1);
      target[4 * g + 2] = w1 >> 16 | w2 << 16;
      target[4 * g + 3] = extended(w2 >> 16);
    }
  }
}

}  // namespace

#endif
