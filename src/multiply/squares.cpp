// Squares: the sum or the difference of two squares a lane.
#include "multiply/products.h"

namespace {

constexpr auto SQUARES = [](auto a, auto b) { return term(a, a) + term(b, b); };
constexpr auto SQUARES_DIFFERENCE = [](auto a, auto b) { return term(a, a) - term(b, b); };

}  // namespace

#include "multiply/stamp.h"

#include "multiply/squares.def"

#include "frame/stamp_end.h"
