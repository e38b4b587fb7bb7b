#include "support/numbers.h"

#include <algorithm>

namespace testing_support {

std::size_t bytes_of(const Format& format) {
  return static_cast<std::size_t>(format.is_predicate ? (format.count + 7) / 8 : format.count * format.container_bytes);
}

Int a_float(int bits, Random& random) {
  const int fraction = bits == 16 ? 10 : 23, exponents = bits - 1 - fraction;
  const Int one = ((Int{1} << (exponents - 1)) - 1) << fraction, unit = Int{1} << fraction;
  const Int infinity = ((Int{1} << exponents) - 1) << fraction;
  const Int ends[] = {
      0, 1, unit - 1, unit, unit + 1, one, infinity - 1, infinity, infinity + 1, infinity + unit / 2 + 5};
  const Int sign = random() % 2 ? Int{1} << (bits - 1) : 0;
  const auto any = static_cast<Int>(random() >> 1);
  switch (random() % 4) {
    case 0:
      return any;
    case 1:
      return sign + ends[random() % std::size(ends)];
    case 2:
      return sign + one + (any % 9 - 4) * unit;
    default:
      return sign + one + (any % 7 - 3) * unit + any / 7 % unit;
  }
}

void fill_lanes(const Format& format, bool is_float, const std::vector<Int>& corners, void* image, Random& random) {
  for (int i = 0; i < format.count; ++i) {
    const std::uint64_t bits = random();
    const Int value = is_float        ? a_float(format.bits, random)
                      : bits % 4 == 0 ? corners[random() % corners.size()]
                      : bits % 4 == 1 ? static_cast<Int>(bits) >> (64 - std::min(64, format.bits / 2 + 1))
                                      : static_cast<Int>(random());
    set_lane(format, image, i, value);
  }
}

}  // namespace testing_support
