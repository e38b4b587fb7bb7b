// Words clamped to narrower lanes.
#ifndef KASTARRI_MULTIPLY_SATURATED_H
#define KASTARRI_MULTIPLY_SATURATED_H

#include <cstdint>
#include <cstring>

#include "frame/arithmetic.h"
#include "frame/lanes.h"
#include "frame/packs.h"

namespace {

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
