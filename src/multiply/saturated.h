// Words clamped to narrower lanes, and every other lane taken out of a register. Processors have single
// instructions for these that compilers do not find, so this is the one place that names them.
#ifndef KASTARRI_MULTIPLY_SATURATED_H
#define KASTARRI_MULTIPLY_SATURATED_H

#include <immintrin.h>

#include <cstdint>
#include <cstring>

#include "frame/arithmetic.h"
#include "frame/lanes.h"

namespace {

// Whether lanes can shift by counts of their own, as fast as by one that they share, and those of 64 bits as signed.
#if defined __AVX2__
constexpr bool lanes_shift_alone = true;
#else
constexpr bool lanes_shift_alone = false;
#endif
#if defined __AVX512BW__
constexpr bool pairs_shift_signed = true;
#else
constexpr bool pairs_shift_signed = false;
#endif

#if defined __AVX512BW__
using Register = __m512i;
inline Register load(const void* from) { return _mm512_loadu_si512(static_cast<const void*>(from)); }
inline Register pack_words(Register a, Register b) { return _mm512_packs_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm512_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm512_packus_epi16(a, b); }
inline Register flip_halves(Register a) { return _mm512_xor_si512(a, _mm512_set1_epi16(-0x8000)); }
// The forms without a mask make the compiler warn of its own header.
inline Register low_pairs(Register a, Register b) { return _mm512_maskz_unpacklo_epi64(0xFF, a, b); }
inline Register high_pairs(Register a, Register b) { return _mm512_maskz_unpackhi_epi64(0xFF, a, b); }
inline Register less_half(Register a) { return _mm512_sub_epi32(a, _mm512_set1_epi32(0x8000)); }
// Packs work within 128 bits: these put pairs and fours of results back in order.
inline Register in_order2(Register a) {
  return _mm512_maskz_permutexvar_epi64(0xFF, _mm512_setr_epi64(0, 2, 4, 6, 1, 3, 5, 7), a);
}
inline Register in_order4(Register a) {
  return _mm512_maskz_permutexvar_epi32(0xFFFF, _mm512_setr_epi32(0, 4, 8, 12, 1, 5, 9, 13, 2, 6, 10, 14, 3, 7, 11, 15),
                                        a);
}
#elif defined __AVX2__
using Register = __m256i;
inline Register load(const void* from) { return _mm256_loadu_si256(static_cast<const Register*>(from)); }
inline Register pack_words(Register a, Register b) { return _mm256_packs_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm256_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm256_packus_epi16(a, b); }
inline Register flip_halves(Register a) { return _mm256_xor_si256(a, _mm256_set1_epi16(-0x8000)); }
inline Register low_pairs(Register a, Register b) { return _mm256_unpacklo_epi64(a, b); }
inline Register high_pairs(Register a, Register b) { return _mm256_unpackhi_epi64(a, b); }
inline Register less_half(Register a) { return _mm256_sub_epi32(a, _mm256_set1_epi32(0x8000)); }
inline Register in_order2(Register a) { return _mm256_permute4x64_epi64(a, 0xD8); }
inline Register in_order4(Register a) {
  return _mm256_permutevar8x32_epi32(a, _mm256_setr_epi32(0, 4, 1, 5, 2, 6, 3, 7));
}
#else
using Register = __m128i;
inline Register load(const void* from) { return _mm_loadu_si128(static_cast<const Register*>(from)); }
inline Register pack_words(Register a, Register b) { return _mm_packs_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm_packus_epi16(a, b); }
inline Register flip_halves(Register a) { return _mm_xor_si128(a, _mm_set1_epi16(-0x8000)); }
inline Register low_pairs(Register a, Register b) { return _mm_unpacklo_epi64(a, b); }
inline Register high_pairs(Register a, Register b) { return _mm_unpackhi_epi64(a, b); }
inline Register less_half(Register a) { return _mm_sub_epi32(a, _mm_set1_epi32(0x8000)); }
inline Register in_order2(Register a) { return a; }
inline Register in_order4(Register a) { return a; }
#endif

// Lanes First, First + 2, ... of 32 lanes in 64-bit containers.
template <int First>
class Alternate48 {
 public:
  explicit Alternate48(const void* acc) {
    constexpr int in_register = sizeof(Register) / sizeof(std::uint64_t);
    for (int k = 0; k < 16; k += in_register) {
      const auto* from = static_cast<const unsigned char*>(acc) + 16 * k;
      const Register a = load(from), b = load(from + sizeof(Register));
      const Register taken = First == 0 ? low_pairs(a, b) : high_pairs(a, b);
      *reinterpret_cast<Register*>(lanes_ + k) = in_order2(taken);
    }
  }
  std::uint64_t operator[](int k) const { return lanes_[k]; }

 private:
  alignas(64) std::uint64_t lanes_[16];
};

// Count words or pairs of them on their way to lanes of type Lane.
template <class Wide, class Lane, int Count>
struct Saturated;

template <class Lane, int Count>
struct Saturated<std::int32_t, Lane, Count> {
  alignas(64) std::int32_t lane[Count];

  void collect(void* r) const {
    if constexpr (sizeof(Lane) == 4) {
      std::memcpy(r, lane, sizeof lane);
    } else {
      constexpr int in_register = sizeof(Register) / sizeof(Lane);
      for (int i = 0; i < Count; i += in_register) {
        const Register packed = collected(reinterpret_cast<const Register*>(lane + i), Lane{});
        std::memcpy(static_cast<Lane*>(r) + i, &packed, sizeof packed);
      }
    }
  }

 private:
  static Register collected(const Register* from, std::int16_t) { return in_order2(pack_words(from[0], from[1])); }
  // Clamped as signed, half the range lower. Words are far from the range's ends.
  static Register collected(const Register* from, std::uint16_t) {
    return flip_halves(in_order2(pack_words(less_half(from[0]), less_half(from[1]))));
  }
  template <class Byte>
  static Register collected(const Register* from, Byte byte) {
    return in_order4(pack_halves(pack_words(from[0], from[1]), pack_words(from[2], from[3]), byte));
  }
};

template <class Lane, int Count>
struct Saturated<std::int64_t, Lane, Count> {
  alignas(64) std::int64_t lane[Count];

  void collect(void* r) const {
#if defined __AVX512BW__
    for (int i = 0; i < Count; i += 8) {
      const Register from = load(lane + i);
      if constexpr (sizeof(Lane) == 4)
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(static_cast<Lane*>(r) + i),
                            _mm512_maskz_cvtsepi64_epi32(0xFF, from));
      else
        _mm_storeu_si128(reinterpret_cast<__m128i*>(static_cast<Lane*>(r) + i),
                         _mm512_maskz_cvtsepi64_epi16(0xFF, from));
    }
#else
    // In halves: no other target compares 64-bit lanes fast.
    Saturated<std::int32_t, Lane, Count> words;
    const auto* half = reinterpret_cast<const in_memory<std::int32_t>*>(lane);
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < Count; ++i) words.lane[i] = one_word(half[2 * i], half[2 * i + 1]);
    words.collect(r);
#endif
  }

 private:
  static constexpr std::int32_t one_word(std::int32_t low, std::int32_t high) {
    return high == low >> 31 ? low : (high >> 31) ^ std::numeric_limits<std::int32_t>::max();
  }
};

}  // namespace

#endif
