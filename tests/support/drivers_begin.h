// What follows, up to drivers_end.h, are tables of rows: a test for each. KASTARRI_TEST_SUITE names the
// suite; a rule R of the table is tested against model::R.
#define KERNEL(OP, FORM, ...) KERNEL_##FORM(OP, __VA_ARGS__)
#define KERNEL_a(OP, R, RULE, A) constexpr auto model_##OP = testing_support::model_of<R, A>(model::RULE);
#define KERNEL_ab(OP, R, RULE, A, B) constexpr auto model_##OP = testing_support::model_of<R, A, B>(model::RULE);
#define KERNEL_ab_bits(OP, RULE, L) \
  constexpr auto model_##OP = testing_support::model_of<Layout<word, 1, L::count, predicate_bit>, L, L>(model::RULE);

#define ENTRY(SYMBOL, SHAPE, ...)                                                                                      \
  const int tested_##SYMBOL = testing_support::add_test(KASTARRI_TEST_SUITE, testing_support::operation(#SYMBOL), [] { \
    TEST_##SHAPE(testing_support::operation(#SYMBOL), &KASTARRI_SYMBOL(SYMBOL), __VA_ARGS__);                          \
  });

#define TEST_ab_r(NAME, F, T, K) testing_support::drive_ab_r(NAME, model_##K, F)
#define TEST_ab_r_T(NAME, F, T, P, K) testing_support::drive_ab_r_T(NAME, model_##K, F)
#define TEST_ab_p(NAME, F, P, T, K) testing_support::drive_ab_r(NAME, model_##K, F)
#define TEST_ab_w(NAME, F, W, A, B, K) testing_support::drive_ab_r(NAME, model_##K, F)
#define TEST_acc_ab(NAME, F, W, A, B, K) testing_support::drive_acc_ab(NAME, model_##K, F)
#define TEST_w_r(NAME, F, R, W, K) testing_support::drive_a_r(NAME, model_##K, F)
#define TEST_w_r_shift(NAME, F, R, W, COUNT, K) testing_support::drive_w_r_shift(NAME, model_##K, F)

#include "frame/rows.h"

namespace {
