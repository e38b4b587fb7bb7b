#include <algorithm>

#include "support/drivers.h"

namespace model {

using testing_support::Int;

constexpr auto ADD = [](Int a, Int b) { return a + b; };
constexpr auto SUB = [](Int a, Int b) { return a - b; };
constexpr auto ADDS = [](Int a, Int b) { return std::clamp<Int>(a + b, -32768, 32767); };
constexpr auto MIN = [](Int a, Int b) { return std::min(a, b); };
constexpr auto MAX = [](Int a, Int b) { return std::max(a, b); };

}  // namespace model

#define KASTARRI_TEST_SUITE "arithmetic"
#include "support/drivers_begin.h"

#include "integer/arithmetic.def"

#include "support/drivers_end.h"
