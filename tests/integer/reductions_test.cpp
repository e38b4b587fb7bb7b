#include <algorithm>

#include "integer/drivers.h"

namespace model {

using testing_support::Int;

constexpr auto EXACT = [](Int sum) { return sum; };
constexpr auto CLAMPED = [](Int sum) { return std::clamp<Int>(sum, -32768, 32767); };

}  // namespace model

namespace testing_support {

// Sums that reach each bound, one lane at a time away from them, and random ones; `call` gets the vector
// and a predicate, all ones or random.
template <class R, class L, class V, class P, class Rule, class Call>
void drive_sum(const std::string& name, Rule rule, Call call) {
  std::mt19937 random(seed);
  const std::vector<Int> values = corners<L>();
  for (std::size_t n = 0; n < values.size() + 200; ++n) {
    V a;
    fill_random<L>(a._, random);
    if (n < values.size())
      for (int i = 0; i < L::count; ++i) set_lane<L>(a._, i, i == static_cast<int>(n) % L::count ? 1 : values[n]);
    P p = filled<P>(n % 4 == 1 ? 0 : 0xFF);
    if (n % 4 > 1) fill_random<layout_of<P>>(p._, random);
    Int sum = 0;
    const auto got = call(a, p, [&](int i) { sum += lane<L>(a._, i); });
    const Int expected[] = {rule(sum)};
    expect_lanes<R>(name, static_cast<int>(n), expected, got, [&](int) { return "sum " + std::to_string(sum); });
    if (testing::Test::HasFatalFailure()) return;
  }
}

template <class Rule, class R, class V>
void drive_reduce(const std::string& name, Rule rule, R (*f)(const V&)) {
  using L = layout_of<V>;
  drive_sum<layout_of<R>, L, V, vboolN>(name, rule, [f](const V& a, const vboolN&, auto add) {
    for (int i = 0; i < L::count; ++i) add(i);
    return f(a);
  });
}

template <class Rule, class R, class V, class P>
void drive_reduce_T(const std::string& name, Rule rule, R (*f)(const V&, const P&)) {
  using L = layout_of<V>;
  drive_sum<layout_of<R>, L, V, P>(name, rule, [f](const V& a, const P& p, auto add) {
    for (int i = 0; i < L::count; ++i)
      if (lane<layout_of<P>>(p._, i)) add(i);
    return f(a, p);
  });
}

}  // namespace testing_support

#define KERNEL_sum(OP, R, RULE, L) constexpr auto model_##OP = model::RULE;
#define TEST_reduce(NAME, F, R, T, K) testing_support::drive_reduce(NAME, model_##K, F)
#define TEST_reduce_T(NAME, F, R, T, P, K) testing_support::drive_reduce_T(NAME, model_##K, F)

#define KASTARRI_TEST_SUITE "reductions"
#include "support/drivers_begin.h"

#include "integer/reductions.def"

#include "support/drivers_end.h"
