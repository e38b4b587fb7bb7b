#include <algorithm>

#include "integer/drivers.h"

namespace model {

using testing_support::Int;
using testing_support::modulo;

template <int w>
constexpr auto MIN = [](Int a, Int b) { return std::min(a, b); };
template <int w>
constexpr auto MAX = [](Int a, Int b) { return std::max(a, b); };
// Twice the mean is the sum less, or plus, what makes it even.
template <int w>
constexpr auto AVG = [](Int a, Int b) { return (a + b - modulo(a + b, 2)) / 2; };
template <int w>
constexpr auto AVGR = [](Int a, Int b) { return (a + b + modulo(a + b, 2)) / 2; };

}  // namespace model

#define KASTARRI_TEST_SUITE "extremes"
#include "support/drivers_begin.h"

#include "integer/extremes.def"

#include "support/drivers_end.h"
