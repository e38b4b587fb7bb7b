// Conversion between two layouts: by the counts of lanes, then lane by lane.
#ifndef KASTARRI_FRAME_CONVERT_H
#define KASTARRI_FRAME_CONVERT_H

#include <type_traits>

#include "frame/lanes.h"

namespace {

// A host scalar is a register of one lane.
template <class H, bool = std::is_integral_v<H>>
struct host_layout_of {
  using type = Layout<H, 8 * sizeof(H), 1>;
};
template <>
struct host_layout_of<bool> {
  using type = Layout<std::uint8_t, 1, 1>;
};
template <>
struct host_layout_of<float> {
  using type = f32x1;
};
template <class H>
using host_layout = typename host_layout_of<H>::type;

template <class L>
constexpr bool is_predicate = std::is_same_v<typename L::number, predicate_bit>;

// A value goes over as it is: wider lanes take its extension, narrower ones its low bits.
constexpr auto same_value = [](auto value) { return value; };

// A wide register and its spill image: lane k of w bits is bits wk .. wk + w - 1 of the image. Four
// 24-bit lanes make three words, two 48-bit lanes likewise.
template <class From>
inline void spill(const word* from, word* to) {
  if constexpr (From::bits == 24) {
    for (int g = 0; g < 16; ++g) {
      const word* lane = from + 4 * g;
      to[3 * g] = (lane[0] & 0xFFFFFF) | lane[1] << 24;
      to[3 * g + 1] = (lane[1] >> 8 & 0xFFFF) | lane[2] << 16;
      to[3 * g + 2] = (lane[2] >> 16 & 0xFF) | lane[3] << 8;
    }
  } else {
    for (int g = 0; g < 16; ++g) {
      const word* lane = from + 4 * g;
      to[3 * g] = lane[0];
      to[3 * g + 1] = (lane[1] & 0xFFFF) | lane[2] << 16;
      to[3 * g + 2] = lane[2] >> 16 | lane[3] << 16;
    }
  }
}

template <class To>
inline void unspill(const word* from, word* to) {
  if constexpr (To::bits == 24) {
    const Write<To> lanes_out(to);
    for (int g = 0; g < 16; ++g) {
      const word* image = from + 3 * g;
      lanes_out.put(4 * g, image[0]);
      lanes_out.put(4 * g + 1, image[0] >> 24 | image[1] << 8);
      lanes_out.put(4 * g + 2, image[1] >> 16 | image[2] << 16);
      lanes_out.put(4 * g + 3, image[2] >> 8);
    }
  } else {
    for (int g = 0; g < 16; ++g) {
      const word* image = from + 3 * g;
      to[4 * g] = image[0];
      to[4 * g + 1] = static_cast<word>(static_cast<std::int32_t>(image[1] << 16) >> 16);
      to[4 * g + 2] = image[1] >> 16 | image[2] << 16;
      to[4 * g + 3] = static_cast<word>(static_cast<std::int32_t>(image[2]) >> 16);
    }
  }
}

// Numbers of different kinds convert by value: float/conversions.cpp.
template <class From, class To, class FromUnit, class ToUnit>
void convert_numbers(const FromUnit* from, ToUnit* to);
template <class From, class To>
constexpr bool are_different_numbers = !std::is_same_v<typename From::number, typename To::number> && From::bits != 1 && To::bits != 1;

template <class From, class To>
inline void convert_lanes(const Read<From>& from, const Write<To>& to) {
  if constexpr (From::count == To::count) {
    lanes<To::count>(to, same_value, from);
  } else if constexpr (From::count == 1) {
    lanes<To::count>(to, same_value, Same(from[0]));
  } else {
    static_assert(To::count == 1);
    to.put(0, from[0]);
  }
}

// vbool1 into every bit of a predicate of many lanes.
template <class To, class FromUnit, class ToUnit>
inline void replicate_bit(const FromUnit* from, ToUnit* to) {
  constexpr int units = To::count / (8 * sizeof(ToUnit));
  for (int i = 0; i < units; ++i) to[i] = static_cast<ToUnit>(*from & 1 ? -1 : 0);
}

template <class From, class To, class FromUnit, class ToUnit>
inline void convert(const FromUnit* from, ToUnit* to) {
  if constexpr (std::is_same_v<To, packed1536>) {
    spill<From>(from, to);
  } else if constexpr (std::is_same_v<From, packed1536>) {
    unspill<To>(from, to);
  } else if constexpr (are_different_numbers<From, To>) {
    convert_numbers<From, To>(from, to);
  } else if constexpr (is_predicate<To> && To::count > 1) {
    replicate_bit<To>(from, to);
  } else {
    convert_lanes(Read<From>(from), Write<To>(to));
  }
}

}  // namespace

#endif
