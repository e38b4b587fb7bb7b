// A predicate's bit a lane as a lane of ones or zeros, and back. Compilers find no good code for packing and unpacking
// single bits, so this is the one place that says it in vector instructions.
#ifndef KASTARRI_FRAME_PREDICATE_H
#define KASTARRI_FRAME_PREDICATE_H

#include <cstdint>

#include "frame/layouts.h"
#include "frame/registers.h"

namespace {

// Lanes of w bits are given w bits of the predicate each and test one of them, lane i bit i mod w: 1, 2, 4, 8 ...
template <class Lane, std::size_t... I>
constexpr Vector<Lane> tested_bits(std::index_sequence<I...>) {
  return Vector<Lane>{static_cast<Lane>(Lane{1} << I % (8 * sizeof(Lane)))...};
}

#if !defined __AVX512BW__
// The byte of a word that holds bit i in lane i, for register number k of bytes: in blocks of 128 bits, of the bytes
// 0 1 2 3 the first is given 0 eight times, then 1 eight times, the second 2 and 3.
inline Bytes byte_of_each(word bits, [[maybe_unused]] int k) {
#if defined __AVX2__
  const __m256i byte_of_lane = _mm256_setr_epi64x(0, 0x0101010101010101, 0x0202020202020202, 0x0303030303030303);
  return in_bits<Bytes>(_mm256_shuffle_epi8(_mm256_set1_epi32(static_cast<int>(bits)), byte_of_lane));
#else
  const __m128i bytes = _mm_set1_epi32(static_cast<int>(bits));
  const __m128i twice = _mm_unpacklo_epi8(bytes, bytes);
  const __m128i fourfold = _mm_unpacklo_epi16(twice, twice);
  return in_bits<Bytes>(k % 2 == 0 ? _mm_unpacklo_epi32(fourfold, fourfold) : _mm_unpackhi_epi32(fourfold, fourfold));
#endif
}
#endif

// Lane i of register number k, of those that the predicate governs: all ones where its bit is 1, else 0.
template <class Lane, class Unit>
inline Vector<Lane> bits_to_lanes(const Unit* predicate, int k) {
  constexpr int width = 8 * sizeof(Lane), unit_bits = 8 * sizeof(Unit);
  const int first = k * lanes_in_register<Lane>;
  [[maybe_unused]] const word bits = predicate[first / unit_bits];
#if defined __AVX512BW__
  if constexpr (width == 8)
    return in_bits<Vector<Lane>>(_mm512_movm_epi8(predicate[0] | std::uint64_t{predicate[1]} << 32));
  else if constexpr (width == 16)
    return in_bits<Vector<Lane>>(_mm512_movm_epi16(bits));
  else
    return in_bits<Vector<Lane>>(_mm512_movm_epi32(static_cast<__mmask16>(bits >> first % unit_bits)));
#else
  const auto tested = tested_bits<Lane>(lane_numbers<Lane>()) << first % width;
  Vector<Lane> given;
  if constexpr (width == 8) {
    given = byte_of_each(bits, k);
  } else {
    const Lane part = static_cast<Lane>(bits >> first % unit_bits / width * width);
    given = Vector<Lane>{} + part;
  }
  return in_bits<Vector<Lane>>((given & tested) == tested);
#endif
}

// The other way round: bit i of the predicate from lane i of registers in memory, which is all ones or 0.
template <class Lane, class Unit>
inline void lanes_to_bits(const Lane* lanes, Unit* predicate) {
  constexpr int width = 8 * sizeof(Lane);
#if defined __AVX512BW__
  const __m512i all = _mm512_load_si512(lanes);
  if constexpr (width == 8) {
    const std::uint64_t bits = _mm512_movepi8_mask(all);
    predicate[0] = static_cast<word>(bits);
    predicate[1] = static_cast<word>(bits >> 32);
  } else if constexpr (width == 16) {
    *predicate = _mm512_movepi16_mask(all);
  } else {
    *predicate = _mm512_movepi32_mask(all);
  }
#else
  // Lanes of more than 8 bits are packed to bytes, which saturation leaves ones or zeros.
  if constexpr (width == 32) {
    const auto* quarter = reinterpret_cast<const __m128i*>(lanes);
    const __m128i low = _mm_packs_epi32(quarter[0], quarter[1]), high = _mm_packs_epi32(quarter[2], quarter[3]);
    *predicate = static_cast<Unit>(_mm_movemask_epi8(_mm_packs_epi16(low, high)));
  } else {
    const auto bytes = [lanes](int k) {
      const auto loaded = [lanes](int number) { return in_bits<Register>(load_register<Lane>(lanes, number)); };
      if constexpr (width == 8)
        return loaded(k);
      else
        return in_order<std::uint64_t>(pack_halves(loaded(2 * k), loaded(2 * k + 1), std::int8_t{}));
    };
    for (int u = 0; u < 2 / static_cast<int>(sizeof(Lane)); ++u) {
#if defined __AVX2__
      predicate[u] = static_cast<word>(_mm256_movemask_epi8(bytes(u)));
#else
      predicate[u] = static_cast<word>(_mm_movemask_epi8(bytes(2 * u))) |
                     static_cast<word>(_mm_movemask_epi8(bytes(2 * u + 1))) << 16;
#endif
    }
  }
#endif
}

template <int LaneBits>
using mask_lane =
    std::conditional_t<LaneBits == 8, std::uint8_t,
                       std::conditional_t<LaneBits == 16, std::uint16_t,
                                          std::conditional_t<LaneBits == 32, std::uint32_t, std::uint64_t>>>;

// All ones where the lane's predicate bit is 1, else 0.
template <int LaneBits, int Count>
struct LaneMask {
  using lane_type = mask_lane<LaneBits>;
  alignas(64) lane_type lane[Count];

  template <class Unit>
  void expand(const Unit* bits) {
    if constexpr (in_registers) {
      for (int k = 0; k < Count / lanes_in_register<lane_type>; ++k)
        store_register(lane, k, bits_to_lanes<lane_type>(bits, k));
    } else {
      constexpr int unit_bits = 8 * sizeof(Unit);
      for (int i = 0; i < Count; ++i)
        lane[i] = (bits[i / unit_bits] >> (i % unit_bits)) & 1 ? static_cast<lane_type>(-1) : lane_type{0};
    }
  }

  template <class Unit>
  void collect(Unit* bits) const {
    if constexpr (in_registers) {
      static_assert(LaneBits * Count == 512);
      lanes_to_bits(lane, bits);
    } else {
      constexpr int unit_bits = 8 * sizeof(Unit);
      constexpr int units = (Count + unit_bits - 1) / unit_bits;
      for (int u = 0; u < units; ++u) {
        Unit packed = 0;
        for (int i = u * unit_bits; i < Count && i < (u + 1) * unit_bits; ++i)
          packed = static_cast<Unit>(packed | static_cast<Unit>(static_cast<Unit>(lane[i] & 1) << (i % unit_bits)));
        bits[u] = packed;
      }
    }
  }

 private:
  // Whole registers; else one-lane scalars, and shapes that are not worth more than a loop.
  static constexpr bool in_registers = LaneBits <= 32 && LaneBits * Count % 512 == 0;
};

}  // namespace

#endif
