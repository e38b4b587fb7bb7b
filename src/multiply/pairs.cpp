// Pairs: the sum or the difference of two products a lane.
#include "multiply/products.h"

namespace {

constexpr auto PAIR = [](auto a, auto b, auto c, auto d) { return term(a, b) + term(c, d); };
constexpr auto PAIR_DIFFERENCE = [](auto a, auto b, auto c, auto d) { return term(a, b) - term(c, d); };

}  // namespace

#include "multiply/stamp.h"

#include "multiply/pairs.def"

#include "frame/stamp_end.h"
