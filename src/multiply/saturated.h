// Words clamped to narrower lanes.
#ifndef KASTARRI_MULTIPLY_SATURATED_H
#define KASTARRI_MULTIPLY_SATURATED_H

#include <cstdint>
#include <cstring>

#include "frame/arithmetic.h"
#include "frame/lanes.h"
#include "frame/registers.h"

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
  template <class Packed>
  static Register collected(const std::int32_t* from, Packed lane_type) {
    const auto words = [from](int k) { return in_bits<Register>(load_register<word>(from, k)); };
    if constexpr (sizeof(Packed) == 2) {
      return in_order<std::uint64_t>(pack_words(words(0), words(1), lane_type));
    } else {
      const auto halves = [words](int k) { return pack_words(words(k), words(k + 1), std::int16_t{}); };
      return in_order<word>(pack_halves(halves(0), halves(2), lane_type));
    }
  }
};

}  // namespace

#endif
