// Words clamped to narrower lanes, and every other lane taken out of a register. Processors have single
// instructions for these that compilers do not find, so this is the one place that names them.
#ifndef KASTARRI_MULTIPLY_SATURATED_H
#define KASTARRI_MULTIPLY_SATURATED_H

#include <immintrin.h>

#include <cstdint>
#include <cstring>

#include "frame/arithmetic.h"
#include "frame/lanes.h"
#include "frame/registers.h"

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

// Words clamped to halves, halves to bytes, block by block: first those of a, then those of b.
#if defined __AVX512BW__
using Register = __m512i;
inline Register pack_words(Register a, Register b) { return _mm512_packs_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm512_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm512_packus_epi16(a, b); }
#elif defined __AVX2__
using Register = __m256i;
inline Register pack_words(Register a, Register b) { return _mm256_packs_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm256_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm256_packus_epi16(a, b); }
#else
using Register = __m128i;
inline Register pack_words(Register a, Register b) { return _mm_packs_epi32(a, b); }
inline Register pack_halves(Register a, Register b, std::int8_t) { return _mm_packs_epi16(a, b); }
inline Register pack_halves(Register a, Register b, std::uint8_t) { return _mm_packus_epi16(a, b); }
#endif

// Lanes First, First + 2, ... of 32 lanes in 64-bit containers.
template <int First>
class Alternate48 {
 public:
  explicit Alternate48(const void* acc) {
    for (int k = 0; k < static_cast<int>(sizeof lanes_) / register_bytes; ++k) {
      const auto a = load_register<std::uint8_t>(acc, 2 * k), b = load_register<std::uint8_t>(acc, 2 * k + 1);
      store_register(lanes_, k, in_order<std::uint64_t>(bits_of(interleaved<First, std::uint64_t>(a, b))));
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
      constexpr int in_register = lanes_in_register<Lane>;
      for (int k = 0; k < Count / in_register; ++k) store_register(r, k, collected(lane + k * in_register, Lane{}));
    }
  }

 private:
  using Bytes = Vector<std::uint8_t>;

  // Register number k of words, so much less.
  static Register words(const std::int32_t* from, int k, word less = 0) {
    return reinterpret_cast<Register>(load_register<word>(from, k) - less);
  }
  static Bytes collected(const std::int32_t* from, std::int16_t) {
    return bits_of(in_order<std::uint64_t>(bits_of(pack_words(words(from, 0), words(from, 1)))));
  }
  // Clamped as signed, half the range lower. Words are far from the range's ends.
  static Bytes collected(const std::int32_t* from, std::uint16_t) {
    const Register packed = pack_words(words(from, 0, 0x8000), words(from, 1, 0x8000));
    return bits_of(as<std::uint16_t>(bits_of(in_order<std::uint64_t>(bits_of(packed)))) ^ 0x8000);
  }
  template <class Byte>
  static Bytes collected(const std::int32_t* from, Byte byte) {
    const Register low = pack_words(words(from, 0), words(from, 1)), high = pack_words(words(from, 2), words(from, 3));
    return bits_of(in_order<word>(bits_of(pack_halves(low, high, byte))));
  }
};

template <class Lane, int Count>
struct Saturated<std::int64_t, Lane, Count> {
  alignas(64) std::int64_t lane[Count];

  void collect(void* r) const {
#if defined __AVX512BW__
    for (int i = 0; i < Count; i += 8) {
      const Register from = _mm512_loadu_si512(lane + i);
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
