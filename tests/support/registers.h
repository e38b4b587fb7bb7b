// Registers as numbers: lanes read and written byte by byte, by another route than the library's.
#ifndef KASTARRI_TESTS_REGISTERS_H
#define KASTARRI_TESTS_REGISTERS_H

#include <cstdint>
#include <cstring>
#include <string>

#include "frame/entry.h"

namespace testing_support {

using Int = std::int64_t;

// Lane i of a register image as a number of the layout. A predicate's lanes are its bits.
template <class L>
Int lane(const void* image, int i) {
  const auto* bytes = static_cast<const unsigned char*>(image);
  if (std::is_same_v<typename L::number, predicate_bit>) return bytes[i / 8] >> (i % 8) & 1;
  constexpr int size = sizeof(typename L::container);
  std::uint64_t bits = 0;
  for (int b = size; b-- > 0;) bits = bits << 8 | bytes[i * size + b];
  if (L::bits < 64) {
    bits %= std::uint64_t{1} << L::bits % 64;
    if (std::is_signed_v<typename L::container> && bits >> (L::bits - 1)) bits -= std::uint64_t{1} << L::bits % 64;
  }
  return static_cast<Int>(bits);
}

// Writes a lane in the form that the library has to leave it in: extended to its container.
template <class L>
void set_lane(void* image, int i, Int value) {
  auto* bytes = static_cast<unsigned char*>(image);
  if (std::is_same_v<typename L::number, predicate_bit>) {
    bytes[i / 8] = static_cast<unsigned char>((bytes[i / 8] & ~(1 << i % 8)) | static_cast<int>(value & 1) << i % 8);
    return;
  }
  constexpr int size = sizeof(typename L::container);
  std::uint64_t bits = static_cast<std::uint64_t>(value);
  if (L::bits < 64) {
    const std::uint64_t range = std::uint64_t{1} << L::bits % 64;
    bits %= range;
    if (std::is_signed_v<typename L::container> && bits >= range / 2) bits -= range;
  }
  // A container of more than 64 bits holds the value over and over.
  for (int b = 0; b < size; ++b) bytes[i * size + b] = static_cast<unsigned char>(bits >> (8 * (b % 8)));
}

// The value as a lane of the layout holds it: its low bits, extended.
template <class L>
Int as_lane(Int value) {
  unsigned char image[sizeof(typename L::container)] = {};
  set_lane<Layout<typename L::container, L::bits, 1, typename L::number>>(image, 0, value);
  return lane<Layout<typename L::container, L::bits, 1, typename L::number>>(image, 0);
}

template <class T>
bool same_bits(const T& x, const T& y) {
  return std::memcmp(x._, y._, sizeof x._) == 0;
}

template <class T>
T filled(unsigned char byte) {
  T v;
  std::memset(v._, byte, sizeof v._);
  return v;
}

}  // namespace testing_support

#endif
