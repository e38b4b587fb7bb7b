#include "integer/drivers.h"
#include "integer/steps.h"

namespace model {

// Counts are signed whatever the type that they come in.
template <int w>
constexpr Int signed_count(Int count) {
  return count >> (w - 1) == 1 ? count - (Int{1} << w) : count;
}

template <int w>
constexpr auto SLL = [](Int a, Int b) {
  const Int s = signed_count<w>(b);
  return s >= 0 ? left<w>(a, s) : right<w>(a, -s);
};
template <int w>
constexpr auto SRL = [](Int a, Int b) {
  const Int s = signed_count<w>(b);
  return s >= 0 ? right<w>(a, s) : left<w>(a, -s);
};
template <int w>
constexpr auto SRA = [](Int a, Int s) { return s >= 0 ? right<w>(a, s) : left<w>(a, -s); };
template <int w>
constexpr auto SLS = [](Int a, Int s) { return s >= 0 ? saturating_left<w>(a, s) : right<w>(a, -s); };

}  // namespace model

#define KASTARRI_TEST_SUITE "shifts"
#include "support/drivers_begin.h"

#include "integer/shifts.def"

#include "support/drivers_end.h"
