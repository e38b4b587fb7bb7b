#include "integer/drivers.h"

namespace model {

using testing_support::Int;

// By the sign of the exact difference.
constexpr auto EQ = [](Int a, Int b) { return a - b == 0; };
constexpr auto NEQ = [](Int a, Int b) { return a - b != 0; };
constexpr auto LT = [](Int a, Int b) { return a - b < 0; };
constexpr auto LE = [](Int a, Int b) { return a - b < 1; };
constexpr auto GT = [](Int a, Int b) { return a - b > 0; };
constexpr auto GE = [](Int a, Int b) { return a - b > -1; };

}  // namespace model

#define KASTARRI_TEST_SUITE "compare"
#include "support/drivers_begin.h"

#include "integer/compare.def"

#include "support/drivers_end.h"
