// The rules of bitwise logic, on data and on predicates.
#ifndef KASTARRI_INTEGER_BITS_H
#define KASTARRI_INTEGER_BITS_H

namespace {

constexpr auto AND = [](auto x, auto y) { return x & y; };
constexpr auto OR = [](auto x, auto y) { return x | y; };
constexpr auto XOR = [](auto x, auto y) { return x ^ y; };
constexpr auto NOT = [](auto x) { return ~x; };
constexpr auto ANDNOT = [](auto x, auto y) { return x & ~y; };
constexpr auto ORNOT = [](auto x, auto y) { return x | ~y; };

}  // namespace

#endif
