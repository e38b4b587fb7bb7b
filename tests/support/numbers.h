// Registers filled with numbers worth computing with.
#ifndef KASTARRI_TESTS_NUMBERS_H
#define KASTARRI_TESTS_NUMBERS_H

#include <random>

#include "support/operands.h"

namespace testing_support {

// Of the same numbers on every host.
using Random = std::mt19937_64;

// What a register takes in memory.
std::size_t bytes_of(const Format& format);

// A float by its bits: of any magnitude; about 1, so that sums cancel and round; the ends of the ranges.
Int a_float(int bits, Random& random);

// Every lane: floats, or integers of which a quarter are corners and a quarter small.
void fill_lanes(const Format& format, bool is_float, const std::vector<Int>& corners, void* image, Random& random);

}  // namespace testing_support

#endif
