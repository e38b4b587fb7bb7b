#include <algorithm>

#include "integer/drivers.h"

namespace model {

using testing_support::Int;
using testing_support::modulo;

// On units of w bits as numbers: a bit that both have counts twice in the sum, and XOR is the sum
// without it.
template <int w>
constexpr auto AND = [](Int a, Int b) {
  Int both = 0;
  for (int k = 0; k < w; ++k) both += (a >> k) % 2 * ((b >> k) % 2) * (Int{1} << k);
  return both;
};
template <int w>
constexpr auto OR = [](Int a, Int b) { return a + b - AND<w>(a, b); };
template <int w>
constexpr auto XOR = [](Int a, Int b) { return a + b - 2 * AND<w>(a, b); };
template <int w>
constexpr auto NOT = [](Int a) { return (Int{1} << w) - 1 - a; };
template <int w>
constexpr auto ANDNOT = [](Int a, Int b) { return a - AND<w>(a, b); };
template <int w>
constexpr auto ORNOT = [](Int a, Int b) { return NOT<w>(b - AND<w>(a, b)); };

// By the number of ones among all bits.
constexpr auto ALL = [](int ones, int count) { return ones == count; };
constexpr auto ANY = [](int ones, int) { return ones != 0; };

constexpr auto MODULO = [](Int n, Int count) { return modulo(n, count); };
constexpr auto CLAMPED = [](Int n, Int count) { return std::clamp<Int>(n, 0, count); };

}  // namespace model

namespace testing_support {

// All predicates with one bit that differs from the others, those without, and random ones.
template <class Rule, class R, class P>
void drive_whole(const std::string& name, Rule rule, R (*f)(const P&)) {
  using L = layout_of<P>;
  std::mt19937 random(seed);
  for (int n = -1; n < L::count + 100; ++n) {
    for (unsigned char fill : {0, 0xFF}) {
      P p = filled<P>(fill);
      if (n >= L::count)
        fill_random<L>(p._, random);
      else if (n >= 0)
        set_lane<L>(p._, n, !fill);
      int ones = 0;
      for (int i = 0; i < L::count; ++i) ones += static_cast<int>(lane<L>(p._, i));
      ASSERT_EQ(f(p)._[0], rule(ones, L::count)) << name << " of " << ones << " ones, round " << n;
    }
  }
}

template <class Rule, class P, class Count>
void drive_n_p(const std::string& name, Rule rule, P (*f)(Count)) {
  using L = layout_of<P>;
  std::vector<int> counts = {1000, -1000, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()};
  for (int n = -130; n <= 130; ++n) counts.push_back(n);
  for (int n : counts) {
    Int expected[L::count];
    for (int i = 0; i < L::count; ++i) expected[i] = i < rule(n, L::count);
    expect_lanes<L>(name, n, expected, f(n), [n](int) { return "count " + std::to_string(n); });
    if (testing::Test::HasFatalFailure()) return;
  }
}

}  // namespace testing_support

#define KERNEL_whole(OP, RULE, L) constexpr auto model_##OP = model::RULE;
#define KERNEL_first(OP, RULE, P) constexpr auto model_##OP = model::RULE;
#define TEST_reduce(NAME, F, R, T, K) testing_support::drive_whole(NAME, model_##K, F)
#define TEST_n_p(NAME, F, P, COUNT, K) testing_support::drive_n_p(NAME, model_##K, F)

#define KASTARRI_TEST_SUITE "predicates"
#include "support/drivers_begin.h"

#include "integer/predicates.def"

#include "support/drivers_end.h"
