// Smaller, larger and mean of two lanes.
#include "frame/arithmetic.h"

#include "integer/kernels.h"

namespace {

constexpr auto MIN = [](auto x, auto y) { return x < y ? x : y; };
constexpr auto MAX = [](auto x, auto y) { return x > y ? x : y; };

// A lane minus the smallest value of its type, as an unsigned number: of 8 bits, -128 .. 127 become 0 .. 255.
constexpr auto from_lowest = [](auto x) {
  using T = decltype(x);
  using U = std::make_unsigned_t<T>;
  return static_cast<U>(unsigned_bits(x) ^ unsigned_bits(std::numeric_limits<T>::min()));
};

// The mean of two lanes without the extra bit of their sum: (a + b) / 2 is (a & b) + ((a ^ b) >> 1) rounded down, and
// (a | b) - ((a ^ b) >> 1) rounded up. Unsigned, for no target shifts signed bytes.
template <class Combine>
struct Mean {
  template <class T>
  constexpr T operator()(T x, T y) const {
    using U = std::make_unsigned_t<T>;
    const U a = from_lowest(x), b = from_lowest(y);
    const U half = static_cast<U>(static_cast<U>(a ^ b) >> 1);
    return static_cast<T>(from_lowest(static_cast<T>(Combine{}(a, b, half))));
  }
};
struct Down {
  template <class U>
  constexpr U operator()(U a, U b, U half) const {
    return static_cast<U>((a & b) + half);
  }
};
struct Up {
  template <class U>
  constexpr U operator()(U a, U b, U half) const {
    return static_cast<U>((a | b) - half);
  }
};
constexpr Mean<Down> AVG;
constexpr Mean<Up> AVGR;

}  // namespace

#include "integer/stamp.h"

#include "integer/extremes.def"

#include "frame/stamp_end.h"
