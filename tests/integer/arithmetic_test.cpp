#include <algorithm>

#include "integer/drivers.h"

namespace model {

using testing_support::Int;

template <int w>
constexpr Int highest = (Int{1} << (w - 1)) - 1;
template <int w>
constexpr Int clamped(Int v) {
  return std::clamp(v, -highest<w> - 1, highest<w>);
}

template <int w>
constexpr auto ADD = [](Int a, Int b) { return a + b; };
template <int w>
constexpr auto SUB = [](Int a, Int b) { return a - b; };
template <int w>
constexpr auto NEG = [](Int a) { return -a; };
template <int w>
constexpr auto ADDS = [](Int a, Int b) { return clamped<w>(a + b); };
template <int w>
constexpr auto SUBS = [](Int a, Int b) { return clamped<w>(a - b); };
template <int w>
constexpr auto NEGS = [](Int a) { return clamped<w>(-a); };
template <int w>
constexpr auto ABS = [](Int a) { return std::max(a, -a); };
template <int w>
constexpr auto ABSS = [](Int a) { return clamped<w>(std::max(a, -a)); };
template <int w>
constexpr auto ABSSUB = [](Int a, Int b) { return std::max(a - b, b - a); };
template <int w>
constexpr auto ABSSSUB = [](Int a, Int b) { return clamped<w>(std::max(a - b, b - a)); };

}  // namespace model

#define KASTARRI_TEST_SUITE "arithmetic"
#include "support/drivers_begin.h"

#include "integer/arithmetic.def"

#include "support/drivers_end.h"
