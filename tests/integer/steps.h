// Shifts one step at a time, as often as the count says, up to the point where nothing is left to move.
#ifndef KASTARRI_TESTS_INTEGER_STEPS_H
#define KASTARRI_TESTS_INTEGER_STEPS_H

#include <algorithm>

#include "support/registers.h"

namespace model {

using testing_support::Int;

template <int w>
constexpr Int left(Int x, Int count) {
  std::uint64_t bits = static_cast<std::uint64_t>(x);
  for (Int n = 0; n < std::min<Int>(count, w); ++n) bits += bits;
  return static_cast<Int>(bits);
}
// floor(x / 2^count)
template <int w>
constexpr Int right(Int x, Int count) {
  for (Int n = 0; n < std::min<Int>(count, w); ++n) x = (x - (x & 1)) / 2;
  return x;
}
// The lane's bits as a number that is not negative.
template <int w>
constexpr Int own_bits(Int x) {
  return x & ((Int{1} << w) - 1);
}
// Doubled as long as it stays in range.
template <int w>
constexpr Int saturating_left(Int x, Int count) {
  const Int highest = (Int{1} << (w - 1)) - 1;
  for (Int n = 0; n < std::min<Int>(count, w); ++n) x = std::clamp(2 * x, -highest - 1, highest);
  return x;
}

}  // namespace model

#endif
