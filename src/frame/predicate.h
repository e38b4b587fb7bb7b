// A predicate's bit a lane as a lane of ones or zeros, and back. Compilers find no good code for
// packing and unpacking single bits, so this is the one place that says it in vector instructions.
#ifndef KASTARRI_FRAME_PREDICATE_H
#define KASTARRI_FRAME_PREDICATE_H

#include <cstdint>

#include "frame/intrinsics.h"
#include "frame/layouts.h"

namespace {

template <int LaneBits>
struct mask_lane;
template <>
struct mask_lane<8> {
  using type = std::uint8_t;
};
template <>
struct mask_lane<16> {
  using type = std::uint16_t;
};
template <>
struct mask_lane<32> {
  using type = std::uint32_t;
};
template <>
struct mask_lane<64> {
  using type = std::uint64_t;
};

// All ones where the lane's predicate bit is 1, else 0. This general form serves the one-lane
// scalars and the shapes that are not worth more.
template <int LaneBits, int Count>
struct LaneMask {
  using lane_type = typename mask_lane<LaneBits>::type;
  alignas(64) lane_type lane[Count];

  template <class Unit>
  void expand(const Unit* bits) {
    constexpr int unit_bits = 8 * sizeof(Unit);
    for (int i = 0; i < Count; ++i)
      lane[i] = (bits[i / unit_bits] >> (i % unit_bits)) & 1 ? static_cast<lane_type>(-1) : lane_type{0};
  }

  template <class Unit>
  void collect(Unit* bits) const {
    constexpr int unit_bits = 8 * sizeof(Unit);
    constexpr int units = (Count + unit_bits - 1) / unit_bits;
    for (int u = 0; u < units; ++u) {
      Unit packed = 0;
      for (int i = u * unit_bits; i < Count && i < (u + 1) * unit_bits; ++i)
        packed = static_cast<Unit>(packed | static_cast<Unit>(static_cast<Unit>(lane[i] & 1) << (i % unit_bits)));
      bits[u] = packed;
    }
  }
};

// 64 lanes of 8 bits under a vbool2N.
template <>
struct LaneMask<8, 64> {
  using lane_type = std::uint8_t;
  alignas(64) lane_type lane[64];

  void expand(const word* bits) {
#if defined __AVX512BW__
    const std::uint64_t all = bits[0] | std::uint64_t{bits[1]} << 32;
    _mm512_store_si512(lane, _mm512_movm_epi8(all));
#elif defined __AVX2__
    const __m256i bit = _mm256_set1_epi64x(static_cast<long long>(0x8040201008040201u));
    const __m256i byte_of_lane = _mm256_setr_epi64x(0, 0x0101010101010101, 0x0202020202020202, 0x0303030303030303);
    for (int h = 0; h < 2; ++h) {
      const __m256i v = _mm256_shuffle_epi8(_mm256_set1_epi32(static_cast<int>(bits[h])), byte_of_lane);
      _mm256_store_si256(reinterpret_cast<__m256i*>(lane) + h, _mm256_cmpeq_epi8(_mm256_and_si256(v, bit), bit));
    }
#else
    const __m128i bit = _mm_set1_epi64x(static_cast<long long>(0x8040201008040201u));
    for (int h = 0; h < 2; ++h) {
      const __m128i bytes = _mm_set1_epi32(static_cast<int>(bits[h]));
      const __m128i twice = _mm_unpacklo_epi8(bytes, bytes);
      const __m128i fourfold = _mm_unpacklo_epi16(twice, twice);
      const auto test = [bit](__m128i v) { return _mm_cmpeq_epi8(_mm_and_si128(v, bit), bit); };
      auto* quarter = reinterpret_cast<__m128i*>(lane) + 2 * h;
      quarter[0] = test(_mm_unpacklo_epi32(fourfold, fourfold));
      quarter[1] = test(_mm_unpackhi_epi32(fourfold, fourfold));
    }
#endif
  }

  void collect(word* bits) const {
#if defined __AVX512BW__
    const std::uint64_t all = _mm512_movepi8_mask(_mm512_load_si512(lane));
    bits[0] = static_cast<word>(all);
    bits[1] = static_cast<word>(all >> 32);
#elif defined __AVX2__
    const auto* half = reinterpret_cast<const __m256i*>(lane);
    for (int h = 0; h < 2; ++h) bits[h] = static_cast<word>(_mm256_movemask_epi8(_mm256_load_si256(half + h)));
#else
    const auto* quarter = reinterpret_cast<const __m128i*>(lane);
    for (int h = 0; h < 2; ++h)
      bits[h] = static_cast<word>(_mm_movemask_epi8(quarter[2 * h])) |
                static_cast<word>(_mm_movemask_epi8(quarter[2 * h + 1])) << 16;
#endif
  }
};

// 32 lanes of 16 bits under a vboolN.
template <>
struct LaneMask<16, 32> {
  using lane_type = std::uint16_t;
  alignas(64) lane_type lane[32];

  void expand(const word* bits) {
#if defined __AVX512BW__
    _mm512_store_si512(lane, _mm512_movm_epi16(*bits));
#elif defined __AVX2__
    const __m256i bit = _mm256_set_epi16(-0x8000, 0x4000, 0x2000, 0x1000, 0x800, 0x400, 0x200, 0x100, 0x80, 0x40, 0x20,
                                         0x10, 8, 4, 2, 1);
    for (int h = 0; h < 2; ++h) {
      const __m256i v = _mm256_set1_epi16(static_cast<short>(*bits >> (16 * h)));
      _mm256_store_si256(reinterpret_cast<__m256i*>(lane) + h, _mm256_cmpeq_epi16(_mm256_and_si256(v, bit), bit));
    }
#else
    const __m128i low = _mm_set_epi16(0x80, 0x40, 0x20, 0x10, 8, 4, 2, 1);
    const __m128i high = _mm_slli_epi16(low, 8);
    for (int h = 0; h < 2; ++h) {
      const __m128i v = _mm_set1_epi16(static_cast<short>(*bits >> (16 * h)));
      auto* quarter = reinterpret_cast<__m128i*>(lane) + 2 * h;
      quarter[0] = _mm_cmpeq_epi16(_mm_and_si128(v, low), low);
      quarter[1] = _mm_cmpeq_epi16(_mm_and_si128(v, high), high);
    }
#endif
  }

  void collect(word* bits) const {
#if defined __AVX512BW__
    *bits = _mm512_movepi16_mask(_mm512_load_si512(lane));
#elif defined __AVX2__
    const auto* half = reinterpret_cast<const __m256i*>(lane);
    const __m256i packed = _mm256_packs_epi16(_mm256_load_si256(half), _mm256_load_si256(half + 1));
    // packs works within 128 bits: put the quarters back in order.
    *bits = static_cast<word>(_mm256_movemask_epi8(_mm256_permute4x64_epi64(packed, 0xD8)));
#else
    const auto* quarter = reinterpret_cast<const __m128i*>(lane);
    *bits = static_cast<word>(_mm_movemask_epi8(_mm_packs_epi16(quarter[0], quarter[1]))) |
            static_cast<word>(_mm_movemask_epi8(_mm_packs_epi16(quarter[2], quarter[3]))) << 16;
#endif
  }
};

// 16 lanes of 32 bits from the low 16 bits.
inline void expand_to_words(std::uint32_t* lane, word bits) {
#if defined __AVX512BW__
  _mm512_store_si512(lane, _mm512_movm_epi32(static_cast<__mmask16>(bits)));
#elif defined __AVX2__
  const __m256i v = _mm256_set1_epi32(static_cast<int>(bits));
  __m256i bit = _mm256_set_epi32(0x80, 0x40, 0x20, 0x10, 8, 4, 2, 1);
  for (int h = 0; h < 2; ++h, bit = _mm256_slli_epi32(bit, 8))
    _mm256_store_si256(reinterpret_cast<__m256i*>(lane) + h, _mm256_cmpeq_epi32(_mm256_and_si256(v, bit), bit));
#else
  const __m128i v = _mm_set1_epi32(static_cast<int>(bits));
  __m128i bit = _mm_set_epi32(8, 4, 2, 1);
  for (int q = 0; q < 4; ++q, bit = _mm_slli_epi32(bit, 4))
    reinterpret_cast<__m128i*>(lane)[q] = _mm_cmpeq_epi32(_mm_and_si128(v, bit), bit);
#endif
}

// 16 lanes of 32 bits under a vboolN_2.
template <>
struct LaneMask<32, 16> {
  using lane_type = std::uint32_t;
  alignas(64) lane_type lane[16];

  void expand(const std::uint16_t* bits) { expand_to_words(lane, *bits); }

  void collect(std::uint16_t* bits) const {
#if defined __AVX512BW__
    *bits = _mm512_movepi32_mask(_mm512_load_si512(lane));
#else
    const auto* quarter = reinterpret_cast<const __m128i*>(lane);
    const __m128i low = _mm_packs_epi32(quarter[0], quarter[1]);
    const __m128i high = _mm_packs_epi32(quarter[2], quarter[3]);
    *bits = static_cast<std::uint16_t>(_mm_movemask_epi8(_mm_packs_epi16(low, high)));
#endif
  }
};

// 32 lanes of 32 bits under a vboolN: addresses of 16-bit elements.
template <>
struct LaneMask<32, 32> {
  using lane_type = std::uint32_t;
  alignas(64) lane_type lane[32];

  void expand(const word* bits) {
    expand_to_words(lane, *bits);
    expand_to_words(lane + 16, *bits >> 16);
  }
};

}  // namespace

#endif
