#include "support/drivers.h"

namespace model {

using testing_support::Int;

// One step at a time, as often as the count says, up to the point where nothing is left to move.
constexpr Int left(Int x, Int count) {
  for (Int n = 0; n < std::min<Int>(count, 16); ++n) x *= 2;
  return x;
}
constexpr Int right(Int x, Int count) {
  for (Int n = 0; n < std::min<Int>(count, 16); ++n) x = (x - (x & 1)) / 2;
  return x;
}

constexpr auto SLL = [](Int a, Int s) { return s >= 0 ? left(a, s) : right(a & 0xFFFF, -s); };
constexpr auto SRA = [](Int a, Int s) { return s >= 0 ? right(a, s) : left(a, -s); };

}  // namespace model

#define KASTARRI_TEST_SUITE "shifts"
#include "support/drivers_begin.h"

#include "integer/shifts.def"

#include "support/drivers_end.h"
