// Words clamped to narrower lanes. Processors have single instructions for these that compilers do not find, so this is
// the one place that names them.
#ifndef KASTARRI_MULTIPLY_SATURATED_H
#define KASTARRI_MULTIPLY_SATURATED_H

#include <immintrin.h>

#include <cstdint>
#include <cstring>

#include "frame/arithmetic.h"
#include "frame/lanes.h"
#include "frame/registers.h"

namespace {

// Words clamped to halves, halves to bytes, block by block: first those of a, then those of b.
#if defined __AVX512BW__
using Register = __m512i;
inline Register pack_words(Register a, Register b, std::int16_t) { return _mm512_packs_epi32(a, b); }
inline Register pack_words(Register a, Register b, std::uint16_t) { return _mm512_packus_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm512_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm512_packus_epi16(a, b); }
#elif defined __AVX2__
using Register = __m256i;
inline Register pack_words(Register a, Register b, std::int16_t) { return _mm256_packs_epi32(a, b); }
inline Register pack_words(Register a, Register b, std::uint16_t) { return _mm256_packus_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm256_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm256_packus_epi16(a, b); }
#else
using Register = __m128i;
inline Register pack_words(Register a, Register b, std::int16_t) { return _mm_packs_epi32(a, b); }
// Clamped as signed, half the range lower. Words are far from the range's ends.
inline Register pack_words(Register a, Register b, std::uint16_t) {
  const Register half = _mm_set1_epi32(0x8000);
  const Register packed = _mm_packs_epi32(_mm_sub_epi32(a, half), _mm_sub_epi32(b, half));
  return _mm_xor_si128(packed, _mm_set1_epi16(-0x8000));
}
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm_packus_epi16(a, b); }
#endif

// Count words on their way to lanes of type Lane.
template <class Lane, int Count>
struct Saturated {
  alignas(64) std::int32_t lane[Count];

  void collect(void* r) const {
    if constexpr (sizeof(Lane) == 4) {
      std::memcpy(r, lane, sizeof lane);
    } else {
      constexpr int in_register = lanes_in_register<Lane>;
      for (int k = 0; k < Count / in_register; ++k) store_register(r, k, collected(lane + k * in_register, Lane{}));
    }
  }

 private:
  using Bytes = Vector<std::uint8_t>;

  static Register words(const std::int32_t* from, int k) {
    return reinterpret_cast<Register>(load_register<word>(from, k));
  }
  template <class Packed>
  static Bytes collected(const std::int32_t* from, Packed lane_type) {
    if constexpr (sizeof(Packed) == 2) {
      return bits_of(in_order<std::uint64_t>(bits_of(pack_words(words(from, 0), words(from, 1), lane_type))));
    } else {
      const auto halves = [from](int k) { return pack_words(words(from, k), words(from, k + 1), std::int16_t{}); };
      return bits_of(in_order<word>(bits_of(pack_halves(halves(0), halves(2), lane_type))));
    }
  }
};

}  // namespace

#endif
