#include <algorithm>
#include <numeric>

#include "integer/drivers.h"

namespace model {

using testing_support::Int;
using Lanes = std::vector<Int>;

constexpr auto EXACT = [](const Lanes& lanes) { return std::accumulate(lanes.begin(), lanes.end(), Int{0}); };
constexpr auto CLAMPED = [](const Lanes& lanes) { return std::clamp<Int>(EXACT(lanes), -32768, 32767); };

// The lane at an end of the lanes in order, the bounds of whose type are beyond them all.
template <class L>
constexpr auto MAX = [](Lanes lanes) {
  lanes.push_back(std::numeric_limits<typename L::container>::min());
  std::sort(lanes.begin(), lanes.end());
  return lanes.back();
};
template <class L>
constexpr auto MIN = [](Lanes lanes) {
  lanes.push_back(std::numeric_limits<typename L::container>::max());
  std::sort(lanes.begin(), lanes.end());
  return lanes.front();
};

// Bit by bit, from the number of lanes in which the bit is 1.
template <class L, class Bit>
Int by_bits(const Lanes& lanes, Bit bit) {
  Int result = 0;
  for (int k = 0; k < L::bits; ++k) {
    const auto ones = std::count_if(lanes.begin(), lanes.end(), [k](Int lane) { return lane >> k & 1; });
    result += Int{bit(static_cast<std::size_t>(ones))} << k;
  }
  return result;
}
template <class L>
constexpr auto XOR =
    [](const Lanes& lanes) { return by_bits<L>(lanes, [](std::size_t ones) { return ones % 2 == 1; }); };
template <class L>
constexpr auto OR = [](const Lanes& lanes) { return by_bits<L>(lanes, [](std::size_t ones) { return ones > 0; }); };
template <class L>
constexpr auto AND =
    [](const Lanes& lanes) { return by_bits<L>(lanes, [&lanes](std::size_t ones) { return ones == lanes.size(); }); };

}  // namespace model

namespace testing_support {

// Lanes that reach each bound, one lane at a time away from them, and random ones; `call` gets the vector, a
// predicate, none, all ones or random, and a collector of the lanes that take part.
template <class R, class L, class V, class P, class Rule, class Call>
void drive_lanes(const std::string& name, Rule rule, Call call) {
  std::mt19937 random(seed);
  const std::vector<Int> values = corners<L>();
  for (std::size_t n = 0; n < values.size() + 200; ++n) {
    V a;
    fill_random<L>(a._, random);
    if (n < values.size())
      for (int i = 0; i < L::count; ++i) set_lane<L>(a._, i, i == static_cast<int>(n) % L::count ? 1 : values[n]);
    P p = filled<P>(n % 4 == 1 ? 0 : 0xFF);
    if (n % 4 > 1) fill_random<layout_of<P>>(p._, random);
    std::vector<Int> taken;
    const auto got = call(
        a, p, [&](int i) { taken.push_back(lane<L>(a._, i)); }, taken);
    const Int expected[] = {rule(taken)};
    expect_lanes<R>(name, static_cast<int>(n), expected, got, [&](int) {
      std::string text = "of";
      for (Int value : taken) text += " " + std::to_string(value);
      return text;
    });
    if (testing::Test::HasFatalFailure()) return;
  }
}

template <class Rule, class R, class V>
void drive_reduce(const std::string& name, Rule rule, R (*f)(const V&)) {
  using L = layout_of<V>;
  drive_lanes<layout_of<R>, L, V, vboolN>(name, rule, [f](const V& a, const vboolN&, auto take, const auto&) {
    for (int i = 0; i < L::count; ++i) take(i);
    return f(a);
  });
}

template <class Rule, class R, class V, class P>
void drive_reduce_T(const std::string& name, Rule rule, R (*f)(const V&, const P&)) {
  using L = layout_of<V>;
  drive_lanes<layout_of<R>, L, V, P>(name, rule, [f](const V& a, const P& p, auto take, const auto&) {
    for (int i = 0; i < L::count; ++i)
      if (lane<layout_of<P>>(p._, i)) take(i);
    return f(a, p);
  });
}

// The accumulator is one value more.
template <class Rule, class R, class V>
void drive_acc_a(const std::string& name, Rule rule, void (*f)(R&, const V&)) {
  using L = layout_of<V>;
  std::mt19937 random(seed);
  drive_lanes<layout_of<R>, L, V, vboolN>(name, rule, [&](const V& a, const vboolN&, auto take, auto& taken) {
    for (int i = 0; i < L::count; ++i) take(i);
    R acc;
    fill_random<layout_of<R>>(acc._, random);
    taken.push_back(lane<layout_of<R>>(acc._, 0));
    f(acc, a);
    return acc;
  });
}

}  // namespace testing_support

#define KERNEL_sum(OP, R, RULE, L) constexpr auto model_##OP = model::RULE;
#define KERNEL_combined(OP, OPERATION, L) constexpr auto model_##OP = model::OPERATION<L>;
#define KERNEL_combined_with KERNEL_combined
#define TEST_reduce(NAME, F, R, T, K) testing_support::drive_reduce(NAME, model_##K, F)
#define TEST_reduce_T(NAME, F, R, T, P, K) testing_support::drive_reduce_T(NAME, model_##K, F)
#define TEST_acc_a(NAME, F, R, T, K) testing_support::drive_acc_a(NAME, model_##K, F)

#define KASTARRI_TEST_SUITE "reductions"
#include "support/drivers_begin.h"

#include "integer/reductions.def"

#include "support/drivers_end.h"
