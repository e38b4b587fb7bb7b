#include "support/drivers.h"

namespace model {

using testing_support::Int;

constexpr auto MUL = [](Int a, Int b) { return a * b; };
// Whatever stands in memory above an accumulator's 48 bits takes no part.
constexpr auto MULA = [](Int acc, Int a, Int b) { return acc % (Int{1} << 48) + a * b; };

}  // namespace model

#define KASTARRI_TEST_SUITE "multiply"
#include "support/drivers_begin.h"

#include "multiply/multiply.def"

#include "support/drivers_end.h"
