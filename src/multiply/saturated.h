// Words clamped to narrower lanes. Processors have one instruction for it that compilers do not find, so
// this is the one place that says it in vector instructions.
#ifndef KASTARRI_MULTIPLY_SATURATED_H
#define KASTARRI_MULTIPLY_SATURATED_H

#include <immintrin.h>

#include <cstdint>
#include <cstring>

#include "frame/arithmetic.h"
#include "frame/layouts.h"

namespace {

#if defined __AVX512BW__
using Register = __m512i;
inline Register pack_words(Register a, Register b) { return _mm512_packs_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm512_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm512_packus_epi16(a, b); }
inline Register flip_halves(Register a) { return _mm512_xor_si512(a, _mm512_set1_epi16(-0x8000)); }
inline Register less_half(Register a) { return _mm512_sub_epi32(a, _mm512_set1_epi32(0x8000)); }
// (The forms without a mask make this compiler warn of its own header.) Packs work within 128 bits: these put pairs and fours of results back in order.
inline Register in_order2(Register a) {
  return _mm512_maskz_permutexvar_epi64(0xFF, _mm512_setr_epi64(0, 2, 4, 6, 1, 3, 5, 7), a);
}
inline Register in_order4(Register a) {
  return _mm512_maskz_permutexvar_epi32(
      0xFFFF, _mm512_setr_epi32(0, 4, 8, 12, 1, 5, 9, 13, 2, 6, 10, 14, 3, 7, 11, 15), a);
}
#elif defined __AVX2__
using Register = __m256i;
inline Register pack_words(Register a, Register b) { return _mm256_packs_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm256_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm256_packus_epi16(a, b); }
inline Register flip_halves(Register a) { return _mm256_xor_si256(a, _mm256_set1_epi16(-0x8000)); }
inline Register less_half(Register a) { return _mm256_sub_epi32(a, _mm256_set1_epi32(0x8000)); }
inline Register in_order2(Register a) { return _mm256_permute4x64_epi64(a, 0xD8); }
inline Register in_order4(Register a) {
  return _mm256_permutevar8x32_epi32(a, _mm256_setr_epi32(0, 4, 1, 5, 2, 6, 3, 7));
}
#else
using Register = __m128i;
inline Register pack_words(Register a, Register b) { return _mm_packs_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm_packus_epi16(a, b); }
inline Register flip_halves(Register a) { return _mm_xor_si128(a, _mm_set1_epi16(-0x8000)); }
inline Register less_half(Register a) { return _mm_sub_epi32(a, _mm_set1_epi32(0x8000)); }
inline Register in_order2(Register a) { return a; }
inline Register in_order4(Register a) { return a; }
#endif

// Count words on their way to lanes of type Lane.
template <class Lane, int Count>
struct Saturated {
  alignas(64) std::int32_t lane[Count];

  void put(int i, std::int32_t value) { lane[i] = value; }

  void collect(void* r) const {
    constexpr int in_register = sizeof(Register) / sizeof(Lane);
    for (int i = 0; i < Count; i += in_register) {
      const Register packed = collected(reinterpret_cast<const Register*>(lane + i), Lane{});
      std::memcpy(static_cast<Lane*>(r) + i, &packed, sizeof packed);
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

// What is a word already needs no second step.
template <int Count>
struct Saturated<std::int32_t, Count> {
  alignas(64) std::int32_t lane[Count];
  void put(int i, std::int32_t value) { lane[i] = value; }
  void collect(void* r) const { std::memcpy(r, lane, sizeof lane); }
};

}  // namespace

#endif
