// Comparisons into predicates.

namespace {

constexpr auto EQ = [](auto x, auto y) { return x == y; };

}  // namespace

#include "frame/stamp.h"

#include "integer/compare.def"

#include "frame/stamp_end.h"
