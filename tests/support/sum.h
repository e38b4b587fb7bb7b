// A number made of all that was added to it, in order: what two builds did is the same if their numbers are.
#ifndef KASTARRI_TESTS_SUM_H
#define KASTARRI_TESTS_SUM_H

#include <algorithm>
#include <cstdint>
#include <cstring>

namespace testing_support {

// FNV-1a on words of 64 bits.
class Sum {
 public:
  void add(std::uint64_t number) { sum_ = (sum_ ^ number) * 0x100000001B3u; }
  void add(const void* bytes, std::size_t size) {
    const auto* from = static_cast<const unsigned char*>(bytes);
    for (std::size_t i = 0; i < size; i += 8) {
      std::uint64_t number = 0;
      std::memcpy(&number, from + i, std::min<std::size_t>(8, size - i));
      add(number);
      sum_ ^= sum_ >> 29;
    }
  }
  std::uint64_t value() const { return sum_; }

 private:
  std::uint64_t sum_ = 0xCBF29CE484222325u;
};

// A single's bits, and an i386's that a function has returned: those pass through a register of its x87, where a
// signalling NaN becomes quiet.
inline void quieten(void* single) {
  std::uint32_t bits;
  std::memcpy(&bits, single, sizeof bits);
  if ((bits & 0x7FFFFFFF) > 0x7F800000) bits |= 0x400000;
  std::memcpy(single, &bits, sizeof bits);
}

}  // namespace testing_support

#endif
