// Multiplies into wide accumulators. A product is exact; sums wrap at the accumulator's lane width.
#include <cstdint>

#include "frame/arithmetic.h"

namespace {

// The exact product of two lanes in twice their width, extended to 64 bits by the factors' signedness.
constexpr auto product = [](std::int16_t x, std::int16_t y) { return std::int64_t{std::int32_t{x} * y}; };

constexpr auto MUL = [](auto x, auto y) { return product(x, y); };
// The whole container takes part: what stands above the lane's own bits is cut from the sum.
constexpr auto MULA = [](auto acc, auto x, auto y) { return acc + unsigned_bits(product(x, y)); };

}  // namespace

#include "frame/stamp.h"

#include "multiply/multiply.def"

#include "frame/stamp_end.h"
