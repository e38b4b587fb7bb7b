#include "support/drivers.h"

namespace model {

using testing_support::Int;

constexpr auto EQ = [](Int a, Int b) { return a - b == 0; };

}  // namespace model

#define KASTARRI_TEST_SUITE "compare"
#include "support/drivers_begin.h"

#include "integer/compare.def"

#include "support/drivers_end.h"
