#include "integer/drivers.h"
#include "integer/steps.h"

namespace model {

using testing_support::modulo;

// The lowest bit goes to the top, as often as the count says.
template <int w>
constexpr auto ROTRI = [](Int a, Int s) {
  Int x = own_bits<w>(a);
  for (Int n = 0; n < s; ++n) x = x / 2 + (x % 2 << (w - 1));
  return x;
};
template <int w>
constexpr auto ROTR = [](Int a, Int s) { return ROTRI<w>(a, modulo(s, w)); };

// The lane can be doubled as often as the count says and no more.
template <int w>
constexpr auto NSA = [](Int a) {
  Int n = 0;
  while (n < w - 1 && saturating_left<w>(a, n + 1) == left<w>(a, n + 1)) ++n;
  return n;
};
template <int w>
constexpr auto NSAU = [](Int a) {
  Int n = w;
  for (; a != 0; a /= 2) --n;
  return n;
};

}  // namespace model

#define KASTARRI_TEST_SUITE "rotates"
#include "support/drivers_begin.h"

#include "integer/rotates.def"

#include "support/drivers_end.h"
