// Sums and differences of narrow lanes: what a product is to a multiply.
#include "multiply/products.h"

namespace {

// Exact in an int, which has room for sums of lanes of 16 bits.
constexpr auto SUM = [](auto a, auto b) { return static_cast<sum_of<decltype(a), decltype(b)>>(a + b); };
constexpr auto DIFFERENCE = [](auto a, auto b) { return static_cast<sum_of<decltype(a), decltype(b)>>(a - b); };

}  // namespace

#include "multiply/stamp.h"

#include "multiply/sums.def"

#include "frame/stamp_end.h"
