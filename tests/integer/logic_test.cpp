#include "integer/drivers.h"

namespace model {

using testing_support::Int;

// Bit by bit, from what two bits add up to.
template <int w, class Bit>
constexpr Int bitwise(Int a, Int b, Bit bit) {
  std::uint64_t r = 0;
  for (int k = 0; k < w; ++k) r |= static_cast<std::uint64_t>(bit((a >> k & 1) + (b >> k & 1))) << k;
  return static_cast<Int>(r);
}

template <int w>
constexpr auto AND = [](Int a, Int b) { return bitwise<w>(a, b, [](Int sum) { return sum == 2; }); };
template <int w>
constexpr auto OR = [](Int a, Int b) { return bitwise<w>(a, b, [](Int sum) { return sum != 0; }); };
template <int w>
constexpr auto XOR = [](Int a, Int b) { return bitwise<w>(a, b, [](Int sum) { return sum == 1; }); };
template <int w>
constexpr auto NOT = [](Int a) { return -1 - a; };

}  // namespace model

#define KASTARRI_TEST_SUITE "logic"
#include "support/drivers_begin.h"

#include "integer/logic.def"

#include "support/drivers_end.h"
