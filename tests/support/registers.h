// Registers as numbers: lanes read and written byte by byte, by another route than the library's. What can be
// is compiled once, for a format known at run time: there are thousands of intrinsics to test.
#ifndef KASTARRI_TESTS_REGISTERS_H
#define KASTARRI_TESTS_REGISTERS_H

#include <cstdint>
#include <cstring>
#include <string>

#include "frame/entry.h"
#include "kastarri/library.h"
#include "kastarri/state.h"

namespace testing_support {

using Int = std::int64_t;

// A layout as a value.
struct Format {
  int bits;             // a lane's own
  int container_bytes;  // what it takes in memory; a predicate's lanes are packed bits
  int count;
  bool is_signed;
  bool is_predicate;
};

template <class L>
constexpr Format format_of() {
  return {L::bits, sizeof(typename L::container), L::count, std::is_signed_v<typename L::container>,
          std::is_same_v<typename L::number, predicate_bit>};
}

// Lane i of a register image as a number.
Int lane(const Format& format, const void* image, int i);

// Writes a lane in the form that the library has to leave it in: extended to its container.
void set_lane(const Format& format, void* image, int i, Int value);

// The value as a lane of the format holds it: its low bits, extended.
Int as_lane(const Format& format, Int value);

template <class L>
Int lane(const void* image, int i) {
  return lane(format_of<L>(), image, i);
}
template <class L>
void set_lane(void* image, int i, Int value) {
  set_lane(format_of<L>(), image, i, value);
}
template <class L>
Int as_lane(Int value) {
  return as_lane(format_of<L>(), value);
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

template <class T>
T as_register(const void* image) {
  T v;
  std::memcpy(v._, image, sizeof v._);
  return v;
}

}  // namespace testing_support

#endif
