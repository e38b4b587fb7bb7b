// Operands of floating-point operations: the edges of a format crossed, then numbers that nearly cancel,
// that make ties, and random ones.
#ifndef KASTARRI_TESTS_FLOAT_CASES_H
#define KASTARRI_TESTS_FLOAT_CASES_H

#include <algorithm>
#include <array>
#include <random>
#include <utility>
#include <vector>

#include "float/exact.h"
#include "support/operands.h"

namespace testing_support {

using exact::Bits;
using Case = std::array<Bits, 3>;

// Both signs of: the ends of the ranges and their neighbours, numbers about 1, patterns, an odd integer, ties
// of rounding to an integer, NaNs with and without the quiet bit.
inline std::vector<Bits> edges(const exact::Format& f) {
  const Bits unit = f.unit(), infinity = f.infinity(), one = static_cast<Bits>(1 - f.least) * unit;
  const Bits integer = one + static_cast<Bits>(f.precision - 1) * unit;  // from here on there are no fractions
  std::vector<Bits> all = {0,
                           1,
                           2,
                           3,
                           unit / 2 + 1,
                           unit - 1,
                           unit,
                           unit + 1,
                           2 * unit - 1,
                           2 * unit,
                           3 * unit + 1,
                           one - 2 * unit,
                           one - unit - 1,
                           one - unit,
                           one - unit + 1,
                           one - 1,
                           one,
                           one + 1,
                           one + unit / 2,
                           one + unit + unit / 4,
                           one + 9 * unit + unit / 3,
                           integer - unit - 1,
                           integer - 1,
                           integer,
                           integer + 1,
                           infinity / 3,
                           infinity - unit - 1,
                           infinity - unit,
                           infinity - 2,
                           infinity - 1,
                           infinity,
                           infinity + 1,
                           infinity + f.quiet() - 1,
                           infinity + f.quiet(),
                           infinity + f.quiet() + 5,
                           f.sign() - 1};
  for (std::size_t i = 0, n = all.size(); i < n; ++i) all.push_back(all[i] + f.sign());
  return all;
}

// x moved by a few units in the last place and a few powers of two, sign and all at times turned.
inline Bits near(const exact::Format& f, Bits x, std::mt19937& random) {
  const int steps = static_cast<int>(random() % 5) - 2, powers = static_cast<int>(random() % 3) - 1;
  const Bits moved = x + static_cast<Bits>(steps) + static_cast<Bits>(powers) * f.unit();
  return (random() & 1 ? moved : moved ^ f.sign()) & (2 * f.sign() - 1);
}

// A number of few bits: its sums and products are ties often.
inline Bits short_number(const exact::Format& f, Bits x, std::mt19937& random) {
  return x & ~((f.unit() >> random() % 5) - 1);
}

// The fractions of two numbers whose product, as one of integers, ends in many zeros and a one.
inline std::pair<Bits, Bits> nearly_short_product(const exact::Format& f, std::mt19937& random) {
  const Bits zeros = (f.width == 16 ? 16 : 64) * f.unit() - 1;
  for (;;) {
    const Bits x = f.unit() + (random() % f.unit() | 1);
    Bits inverse = 1;
    for (int bits = 1; bits < 32; bits *= 2) inverse *= 2 - x * inverse;
    const Bits y = f.unit() + inverse % f.unit();
    if ((x * y & zeros) == 1) return {x - f.unit(), y - f.unit()};
  }
}

// acc, of few powers, and two factors whose product it takes to a tie but for its own last bit: what is lost of acc
// beside the product, or of the product, makes a tie of the sum. The product is a little more than a power of two, acc
// a little less than one, so that their exponents alone say least of how far they are apart.
inline void add_near_ties(std::vector<Case>& all, const exact::Format& f, std::mt19937& random) {
  const int p = f.precision;
  const Bits one = static_cast<Bits>(1 - f.least) * f.unit();
  for (int exponent = p - 3; exponent > p - 10 && exponent - 2 * p + 2 >= f.least; --exponent) {
    for (int found = 0; found < 12;) {
      const std::uint64_t x = f.unit() + f.unit() / 3 + random() % (f.unit() / 5);
      const std::uint64_t y = (std::uint64_t{1} << (2 * p - 1)) / x + 1 + random() % (f.unit() >> 7);
      const std::uint64_t tie = std::uint64_t{1} << (p - 1), rest = x * y % (2 * tie),
                          beyond = std::uint64_t{1} << exponent;
      const std::uint64_t apart = rest > tie ? rest - tie : tie - rest;
      if (apart < beyond + beyond * 7 / 8 || apart >= 2 * beyond) continue;
      const auto fraction = static_cast<Bits>((apart - beyond) << (p - 1 - exponent));
      const Bits acc =
          one + static_cast<Bits>(exponent - 2 * p + 2) * f.unit() + fraction + (rest > tie ? f.sign() : 0);
      for (const Bits moved : {acc - 1, acc, acc + 1})
        all.push_back({moved, one - f.unit() + static_cast<Bits>(x), one - f.unit() + static_cast<Bits>(y)});
      ++found;
    }
  }
}

// Registers of cases whose lanes are all alike in how far the exponents of their terms are apart: of two operands, or
// of acc and the product of two. What a vector is computed by depends on the farthest lane.
inline void add_registers_by_distance(std::vector<Case>& all, const exact::Format& f, int operands,
                                      std::mt19937& random) {
  constexpr std::size_t lanes = 32;
  const Bits one = static_cast<Bits>(1 - f.least) * f.unit();
  const auto fraction = [&]() -> Bits {
    const Bits few = random() % 4;
    switch (random() % 5) {
      case 0:
        return few;
      case 1:
        return f.unit() - 1 - few;
      case 2:
        return (f.unit() / 2 + few - 2) % f.unit();
      case 3:
        return random() % f.unit() & ~((f.unit() >> random() % 5) - 1);
      default:
        return random() % f.unit();
    }
  };
  const auto number = [&](int exponent) {
    return one + static_cast<Bits>(exponent) * f.unit() + fraction() + (random() & 1 ? f.sign() : 0);
  };
  all.resize((all.size() + lanes - 1) / lanes * lanes);
  const int farthest = std::min(-f.least, f.precision + 8);
  for (int distance = -farthest; distance <= farthest; ++distance) {
    const auto far = one + static_cast<Bits>(distance) * f.unit();
    for (std::size_t i = 0; i < lanes; ++i) all.push_back({far, one, one});  // exact, unless far apart
    for (std::size_t i = 0; i < 6 * lanes; ++i) {
      all.push_back({number(distance), number(0), number(0)});
      if (operands == 2 || i % 4 != 0) continue;
      const auto [u, v] = nearly_short_product(f, random);
      all.back() = {all.back()[0], one + u, one + v};
    }
  }
  // Among lanes that are near, zeros, each operand's in turn, beside numbers of other exponents; or a special number.
  const std::vector<Bits> edge = edges(f);
  for (std::size_t i = 0; i < 16 * lanes; ++i) {
    all.push_back({number(0), number(0), number(0)});
    if (i % 4 != 0) continue;
    const int reach = -f.least / 2;
    for (Bits& x : all.back()) x = number(static_cast<int>(random()) % reach);
    const std::size_t k = i / 4 % static_cast<std::size_t>(operands);
    all.back()[k] = i / lanes % 4 == 3 ? edge[random() % edge.size()] : all.back()[k] & f.sign();
  }
  // A subnormal factor, whose exponent does not tell how far below acc the product is.
  for (int exponent = f.least; operands == 3 && exponent < f.least + 2 * f.precision; ++exponent)
    for (std::size_t i = 0; i < lanes; ++i) all.push_back({number(exponent), 1 + below(random, 7), number(0)});
}

inline std::vector<Case> cases(const exact::Format& f, int operands) {
  std::vector<Case> all;
  if (operands == 1 && f.width == 16) {
    for (Bits x = 0; x < 0x10000; ++x) all.push_back({x, 0, 0});
    return all;
  }
  const std::vector<Bits> edge = edges(f);
  std::mt19937 random(seed);
  const auto any = [&] { return static_cast<Bits>(random() & (2 * f.sign() - 1)); };
  for (Bits a : edge) {
    for (Bits b : edge) {
      if (operands < 3) all.push_back({a, b, 0});
      if (operands == 3)
        for (int i = 0; i < 6; ++i) all.push_back({i < 4 ? edge[random() % edge.size()] : any(), a, b});
    }
  }
  for (int i = 0; i < 3000; ++i) {
    const Bits a = any(), b = any();
    all.push_back({a, b, any()});
    all.push_back({a, near(f, a, random), any()});
    all.push_back({short_number(f, a, random), short_number(f, b, random), short_number(f, any(), random)});
    // acc near the product of two factors about 1, so that the sum nearly cancels; or a tie's distance from it.
    const Bits one = static_cast<Bits>(1 - f.least) * f.unit();
    const Bits x = one + random() % f.unit(), y = one + random() % f.unit();
    exact::Number p(f, x), q(f, y), product;
    mpfr_mul(product, p, q, MPFR_RNDN);
    const Bits rounded = exact::round(f, product, MPFR_RNDN).bits;
    all.push_back({near(f, rounded, random), x, y});
    // acc at every distance from the product, its last bits among the product's or below them; and from a product of 0.
    const Bits apart = static_cast<Bits>(i % (4 * f.precision) - 2 * f.precision) * f.unit();
    const Bits distant = one + apart + (random() & 1 ? any() : short_number(f, any(), random)) % f.unit();
    all.push_back({(distant + (any() & f.sign())) & (2 * f.sign() - 1), x, y});
    all.push_back({a, b & f.sign(), any()});
    if (i % 3 == 0) {
      // acc that takes from the product what it has beyond the format, but for an acc's last bit.
      mpfr_sub(product, product, exact::Number(f, rounded), MPFR_RNDN);
      const Bits beyond = exact::round(f, product, MPFR_RNDN).bits;
      all.push_back({(beyond ^ f.sign()) + below(random, 3) - 1, x, y});
      // acc a few powers above a product that its last bit alone keeps from being a short number.
      const auto [u, v] = nearly_short_product(f, random);
      all.push_back({one + (2 + below(random, 6)) * f.unit() - 1 - below(random, 4), one + u, one + v});
    }
    all.push_back(
        {short_number(f, one, random) - static_cast<Bits>(f.precision - 1 + static_cast<int>(random() % 3)) * f.unit(),
         x, y});
    all.push_back({x, short_number(f, any(), random), one - static_cast<Bits>(f.precision) * f.unit()});
  }
  if (operands == 3) add_near_ties(all, f, random);
  if (operands > 1) add_registers_by_distance(all, f, operands, random);
  return all;
}

}  // namespace testing_support

#endif
