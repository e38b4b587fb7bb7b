#include <algorithm>

#include "support/drivers.h"

namespace model {

using testing_support::Int;

// floor(a / 2^n)
constexpr Int floor_shift(Int a, int n) {
  const Int d = Int{1} << n;
  return (a - ((a % d) + d) % d) / d;
}

constexpr auto Rounded = [](Int acc, int count) {
  const int s = count < 0 || count > 32 ? 32 : count;
  // Half up: floor(acc / 2^s + 1/2), formed on twice the number.
  return std::clamp<Int>(s == 0 ? acc : floor_shift(2 * acc + (Int{1} << s), s + 1), -32768, 32767);
};
constexpr auto PACKQ = [](Int acc) { return floor_shift(2 * (acc & 0xFFFFFFFF) + 0x8000, 16); };

}  // namespace model

#define KASTARRI_TEST_SUITE "pack"
#define KERNEL_pack48(OP, R, ROUNDING) \
  constexpr auto model_##OP = testing_support::model_of<R, i48x32>(model::ROUNDING);
#include "support/drivers_begin.h"

#include "multiply/pack.def"

#include "support/drivers_end.h"
