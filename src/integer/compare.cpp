// Comparisons into predicates.

namespace {

constexpr auto EQ = [](auto x, auto y) { return x == y; };
constexpr auto NEQ = [](auto x, auto y) { return x != y; };
constexpr auto LT = [](auto x, auto y) { return x < y; };
constexpr auto LE = [](auto x, auto y) { return x <= y; };
constexpr auto GT = [](auto x, auto y) { return x > y; };
constexpr auto GE = [](auto x, auto y) { return x >= y; };

}  // namespace

#include "integer/stamp.h"

#include "integer/compare.def"

#include "frame/stamp_end.h"
