// One driver a shape of intrinsic. A driver calls the exported function on operands worth trying and
// compares every word of the result with what a model of the operation says: a scalar expression on
// exact integers.
//
// A test source defines a model a rule in namespace model, lists its tables between drivers_begin.h and
// drivers_end.h, and gets a test a row.
#ifndef KASTARRI_TESTS_DRIVERS_H
#define KASTARRI_TESTS_DRIVERS_H

#include <gtest/gtest.h>

#include <functional>
#include <limits>
#include <string>
#include <vector>

#include "support/operands.h"

namespace testing_support {

// What the semantic function of an operation computes: lane i of R = Rule(lanes i of the operands).
template <class R, class Rule, class... Operands>
struct Model {
  using result = R;
  Rule rule;
};

template <class R, class... Ls, class Rule>
constexpr Model<R, Rule, Ls...> model_of(Rule rule) {
  return {rule};
}

// Compares lanes, then the whole image of `bytes` bytes: nothing but the lanes may differ from the canonical
// form. `operands_of(i)` says what lane i was computed from.
void expect_image(const std::string& name, int round, const Format& format, const Int* expected, const void* got,
                  std::size_t bytes, const std::function<std::string(int)>& operands_of);

template <class L, class T>
void expect_lanes(const std::string& name, int round, const Int (&expected)[L::count], const T& got,
                  const std::function<std::string(int)>& operands_of) {
  expect_image(name, round, format_of<L>(), expected, got._, sizeof got._, operands_of);
}

// An operation to check: formats, the model's rule on the operands' lanes, the call, and what replaces
// expected lanes afterwards (predicated forms keep some of their destination's).
struct Operation {
  std::string name;
  Format result;
  std::vector<Format> operands;
  std::function<Int(const Int*)> rule;
  std::function<std::size_t(const Image*, void*)> call;  // writes the result's image, returns its size
  std::function<void(int, Int*)> adjust;
  bool all_values = true;  // of a single operand of 16 bits or fewer
};

// Calls the operation for every round of operands and compares every lane.
void check(const Operation& operation);

template <class Rule, std::size_t... I>
Int apply(const Rule& rule, const Int* values, std::index_sequence<I...>) {
  return static_cast<Int>(rule(values[I]...));
}

template <class R, class Rule, class... Ls, class Call, class Adjust>
void check(const std::string& name, const Model<R, Rule, Ls...>& model, Call call, Adjust adjust,
           bool all_values = true) {
  check(Operation{name,
                  format_of<R>(),
                  {format_of<Ls>()...},
                  [&model](const Int* values) { return apply(model.rule, values, std::index_sequence_for<Ls...>{}); },
                  [&call](const Image* images, void* result) {
                    const auto r = call(images);
                    std::memcpy(result, r._, sizeof r._);
                    return sizeof r._;
                  },
                  adjust,
                  all_values});
}

template <class Model, class Call>
void check(const std::string& name, const Model& model, Call call) {
  check(name, model, call, [](int, Int*) {});
}

// --- Shapes -------------------------------------------------------------------------------------------

template <class Model, class R, class A>
void drive_a_r(const std::string& name, const Model& model, R (*f)(const A&)) {
  check(name, model, [f](const auto* images) { return f(as_register<A>(images[0].bytes)); });
}

template <class Model, class R, class A, class B>
void drive_ab_r(const std::string& name, const Model& model, R (*f)(const A&, const B&)) {
  check(name, model,
        [f](const auto* images) { return f(as_register<A>(images[0].bytes), as_register<B>(images[1].bytes)); });
}

// The destination takes part as the first operand: it is read and written.
template <class Model, class W, class A, class B>
void drive_acc_ab(const std::string& name, const Model& model, void (*f)(W&, const A&, const B&)) {
  check(name, model, [f](const auto* images) {
    W acc = as_register<W>(images[0].bytes);
    f(acc, as_register<A>(images[1].bytes), as_register<B>(images[2].bytes));
    return acc;
  });
}

// A count that all lanes share is the rule's second argument: every count within the widest lane, and
// counts far outside it, each with the corners of a lane.
template <class R, class Rule, class L, class T, class W, class Count>
void drive_w_r_shift(const std::string& name, const Model<R, Rule, L>& model, T (*f)(const W&, Count)) {
  std::vector<int> counts = {-1, -7, 1000, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()};
  for (int count = 0; count <= 66; ++count) counts.push_back(count);
  for (int count : counts) {
    const auto counted = [&](Int lane) { return model.rule(lane, count); };
    check(
        name + " count " + std::to_string(count), model_of<R, L>(counted),
        [=](const auto* images) { return f(as_register<W>(images[0].bytes), static_cast<Count>(count)); },
        [](int, Int*) {}, false);
    if (testing::Test::HasFatalFailure()) return;
  }
}

// Predicates of all zeros, all ones, then random bits, and the destination's old lanes beside them.
template <class R, class P>
class Destination {
 public:
  // What a predicated form has to leave: the computed lane where the bit is 1, else the old one.
  void operator()(int n, Int* expected) {
    p = filled<P>(n % 8 == 0 ? 0 : 0xFF);
    if (n % 8 > 1) fill_random<layout_of<P>>(p._, random_);
    fill_random<layout_of<R>>(old._, random_);
    for (int i = 0; i < layout_of<R>::count; ++i)
      if (!lane<layout_of<P>>(p._, i)) expected[i] = lane<layout_of<R>>(old._, i);
  }

  P p;
  R old;

 private:
  std::mt19937 random_{seed};
};

template <class Model, class R, class A, class B, class P>
void drive_ab_r_T(const std::string& name, const Model& model, void (*f)(R&, const A&, const B&, const P&)) {
  Destination<R, P> destination;
  check(
      name, model,
      [&](const auto* images) {
        R r = destination.old;
        f(r, as_register<A>(images[0].bytes), as_register<B>(images[1].bytes), destination.p);
        return r;
      },
      std::ref(destination));
  // The destination handed in as both operands: a lane reads its own lane before it is written.
  if constexpr (std::is_same_v<R, A> && std::is_same_v<R, B>) {
    check(name + " in place", model, [&](const auto* images) {
      const R a = as_register<R>(images[0].bytes);
      R r = a, other = as_register<R>(images[1].bytes);
      const P all = filled<P>(0xFF);
      f(r, r, other, all);
      f(other, a, other, all);
      EXPECT_TRUE(same_bits(r, other)) << name << " in place";
      return r;
    });
  }
}

// The operation of a symbol: ADDNX16 of rk_zra32_ZRA_ADDNX16, and any other name as it is.
const char* operation(const char* symbol);

// Registers a test of an exported function by its operation's name.
int add_test(const char* suite, const char* name, std::function<void()> body);

}  // namespace testing_support

#endif
