#include "integer/drivers.h"
#include "integer/steps.h"

namespace model {

template <int w>
constexpr auto SLLI = [](Int a, Int s) { return left<w>(a, s); };
template <int w>
constexpr auto SRLI = [](Int a, Int s) { return right<w>(own_bits<w>(a), s); };
template <int w>
constexpr auto SRAI = [](Int a, Int s) { return right<w>(a, s); };
template <int w>
constexpr auto SLSI = [](Int a, Int s) { return saturating_left<w>(a, s); };

}  // namespace model

#define KASTARRI_TEST_SUITE "immediate_shifts"
#include "support/drivers_begin.h"

#include "integer/immediate_shifts.def"

#include "support/drivers_end.h"
