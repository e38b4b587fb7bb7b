#include "support/drivers.h"

namespace model {

using testing_support::Int;

constexpr auto MUL = [](Int a, Int b) { return a * b; };
constexpr auto MULA = [](Int acc, Int a, Int b) { return acc + a * b; };

}  // namespace model

#define KASTARRI_TEST_SUITE "multiply"
#include "support/drivers_begin.h"

#include "multiply/multiply.def"

#include "support/drivers_end.h"
