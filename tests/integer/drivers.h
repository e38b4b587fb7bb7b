// Drivers and forms of models that integer operations have. A model depends on the lane width:
// model::RULE<bits>.
#ifndef KASTARRI_TESTS_INTEGER_DRIVERS_H
#define KASTARRI_TESTS_INTEGER_DRIVERS_H

#include "kastarri/integer.h"
#include "support/drivers.h"

#define KERNEL_unary(OP, RULE, L) constexpr auto model_##OP = testing_support::model_of<L, L>(model::RULE<L::bits>);
#define KERNEL_binary(OP, RULE, L) constexpr auto model_##OP = testing_support::model_of<L, L, L>(model::RULE<L::bits>);
// With a count that all lanes share the model is rule(lane, count modulo the width).
#define KERNEL_packed(OP, RULE, L)                                                                    \
  constexpr auto model_##OP = testing_support::model_of<L, L>([](testing_support::Int a, int count) { \
    return model::RULE<L::bits>(a, testing_support::modulo(count, L::bits));                          \
  });
#define KERNEL_counted KERNEL_packed

#define TEST_a_r(NAME, F, T, K) testing_support::drive_a_r(NAME, model_##K, F)
#define TEST_a_r_T(NAME, F, T, P, K) testing_support::drive_a_r_T(NAME, model_##K, F)
#define TEST_a_i_r(NAME, F, T, K) testing_support::drive_w_r_shift(NAME, model_##K, F)

namespace testing_support {

// The remainder that is not negative.
constexpr Int modulo(Int a, Int n) { return ((a % n) + n) % n; }

template <class Model, class R, class A, class P>
void drive_a_r_T(const std::string& name, const Model& model, void (*f)(R&, const A&, const P&)) {
  Destination<R, P> destination;
  check(
      name, model,
      [&](const auto* images) {
        R r = destination.old;
        f(r, as_register<A>(images[0].bytes), destination.p);
        return r;
      },
      std::ref(destination));
  check(name + " in place", model, [&](const auto* images) {
    R r = as_register<R>(images[0].bytes);
    f(r, r, filled<P>(0xFF));
    return r;
  });
}

}  // namespace testing_support

#endif
