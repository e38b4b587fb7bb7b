// Operands worth trying: corners of a lane crossed with each other, all values of small lanes, and
// seeded random ones.
#ifndef KASTARRI_TESTS_OPERANDS_H
#define KASTARRI_TESTS_OPERANDS_H

#include <random>
#include <vector>

#include "support/registers.h"

namespace testing_support {

inline constexpr unsigned seed = 20231;

// A random number below n. The generator's own numbers have 64 bits on some hosts.
inline unsigned below(std::mt19937& random, unsigned n) { return static_cast<unsigned>(random()) % n; }

// The values of a lane at which rules change: small counts of either sign, bounds, powers of two and
// their neighbours; every value of a lane of 8 bits or fewer.
std::vector<Int> corners(const Format& format);

// Random lanes; every other one is small, so that results do not all saturate or wrap.
void fill_random(const Format& format, void* image, std::mt19937& random);

template <class L>
std::vector<Int> corners() {
  return corners(format_of<L>());
}
template <class L>
void fill_random(void* image, std::mt19937& random) {
  fill_random(format_of<L>(), image, random);
}

struct Image {
  alignas(64) unsigned char bytes[256];
};

// Rounds of register images for an operation's operands: every pair of corners of the last two operands
// meets in some lane, the others run through their corners beside them; then random lanes. One operand
// of 16 bits or fewer takes all its values if it may.
class OperandImages {
 public:
  explicit OperandImages(std::vector<Format> formats, bool all_values = true);

  int rounds() const { return cross_rounds_ + random_rounds; }

  // The images of round n, one an operand; call in order.
  const Image* round(int n);

 private:
  static constexpr int random_rounds = 100;

  Int corner(std::size_t operand, std::size_t number) const;

  std::vector<Format> formats_;
  std::vector<std::vector<Int>> values_;
  int lanes_ = 1;
  int cross_rounds_ = 0;
  std::mt19937 random_{seed};
  std::vector<Image> images_;
};

template <class... Ls>
class Operands : public OperandImages {
 public:
  Operands() : OperandImages({format_of<Ls>()...}) {}
};

}  // namespace testing_support

#endif
