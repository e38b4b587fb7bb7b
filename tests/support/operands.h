// Operands worth trying: corners of a lane crossed with each other, all values of small lanes, and
// seeded random ones.
#ifndef KASTARRI_TESTS_OPERANDS_H
#define KASTARRI_TESTS_OPERANDS_H

#include <algorithm>
#include <random>
#include <utility>
#include <vector>

#include "support/registers.h"

namespace testing_support {

inline constexpr unsigned seed = 20231;

// The values of a lane at which rules change: small counts of either sign, bounds, powers of two and
// their neighbours; every value of an 8-bit lane.
template <class L>
std::vector<Int> corners() {
  std::vector<Int> values;
  if (L::bits <= 8) {
    for (Int v = 0; v < Int{1} << L::bits % 64; ++v) values.push_back(as_lane<L>(v));
    return values;
  }
  for (Int v = -3; v <= 3; ++v) values.push_back(as_lane<L>(v));
  for (Int v : {-70, -40, -33, -32, -31, -20, -17, -16, -15, -8, 7, 8, 15, 16, 17, 31, 32, 33, 40, 64, 70, 1000})
    values.push_back(as_lane<L>(v));
  for (int k = 2; k < std::min(L::bits, 64); ++k)
    for (Int d = -1; d <= 1; ++d)
      values.push_back(as_lane<L>(static_cast<Int>((std::uint64_t{1} << k) + static_cast<std::uint64_t>(d))));
  for (std::uint64_t pattern : {0x5555555555555555u, 0xAAAAAAAAAAAAAAAAu, 0x123456789ABCDEFu})
    values.push_back(as_lane<L>(static_cast<Int>(pattern)));
  std::sort(values.begin(), values.end());
  values.erase(std::unique(values.begin(), values.end()), values.end());
  return values;
}

template <class L>
void fill_random(void* image, std::mt19937& random) {
  for (int i = 0; i < L::count; ++i) {
    const std::uint64_t bits = std::uint64_t{random()} << 32 | random();
    // Every other lane is small, so that results do not all saturate or wrap.
    set_lane<L>(image, i, static_cast<Int>(random() & 1 ? bits : bits >> (64 - std::min(64, L::bits / 2 + 1))));
  }
}

// Rounds of register images for the layouts of an operation's operands: every pair of corners of the
// last two operands meets in some lane, the others run through their corners beside them; then random
// lanes. One operand of 16 bits or fewer takes all its values.
template <class... Ls>
class Operands {
 public:
  static constexpr int operands = sizeof...(Ls);
  struct Image {
    alignas(64) unsigned char bytes[256];
  };

  Operands() : values_{values<Ls>()...}, random_(seed) {}

  int rounds() const { return cross_rounds() + random_rounds; }

  // The images of round n; call in order.
  const Image* round(int n) {
    n < cross_rounds() ? fill_cross(n, std::index_sequence_for<Ls...>{})
                       : fill_random(std::index_sequence_for<Ls...>{});
    return images_;
  }

 private:
  static constexpr int random_rounds = 100;
  static constexpr int lanes = std::max({Ls::count...});

  template <class L>
  static std::vector<Int> values() {
    std::vector<Int> all;
    if (operands > 1 || L::bits > 16) return corners<L>();
    for (Int v = 0; v < Int{1} << L::bits % 64; ++v) all.push_back(as_lane<L>(v));
    return all;
  }

  std::size_t size(int operand) const { return values_[operand].size(); }

  int cross_rounds() const {
    const std::size_t pairs = size(operands - 1) * (operands > 1 ? size(operands - 2) : 1);
    return static_cast<int>((pairs + lanes - 1) / lanes);
  }

  Int corner(int operand, std::size_t number) const {
    const std::size_t index = operand == operands - 1   ? number
                              : operand == operands - 2 ? number / size(operands - 1)
                                                        : number * 7 + static_cast<std::size_t>(operand);
    return values_[operand][index % size(operand)];
  }

  template <std::size_t... I>
  void fill_cross(int n, std::index_sequence<I...>) {
    const auto fill = [&](auto layout, int operand) {
      using L = typename decltype(layout)::type;
      for (int i = 0; i < L::count; ++i)
        set_lane<L>(images_[operand].bytes, i,
                    corner(operand, static_cast<std::size_t>(n) * lanes + static_cast<std::size_t>(i)));
    };
    (fill(layout_tag<Ls>{}, I), ...);
  }

  template <std::size_t... I>
  void fill_random(std::index_sequence<I...>) {
    (testing_support::fill_random<Ls>(images_[I].bytes, random_), ...);
  }

  template <class L>
  struct layout_tag {
    using type = L;
  };

  std::vector<Int> values_[operands];
  std::mt19937 random_;
  Image images_[operands] = {};
};

}  // namespace testing_support

#endif
