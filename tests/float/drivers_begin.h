// What follows, up to support/drivers_end.h, are tables of floating-point rows: a test for each, against
// the model of the rule's name.
#define KERNEL(OP, FORM, ...) KERNEL_##FORM(OP, __VA_ARGS__)
#define KERNEL_float_a(OP, RULE, L) constexpr testing_support::Model_function model_##OP = model::RULE;
#define KERNEL_float_ab KERNEL_float_a
#define KERNEL_float_abc KERNEL_float_a
#define KERNEL_float_ab_bits KERNEL_float_a
#define KERNEL_float_bits KERNEL_float_a
#define KERNEL_float_const(OP, RULE, L)

#define ENTRY(SYMBOL, SHAPE, ...)                                                                                      \
  const int tested_##SYMBOL = testing_support::add_test(KASTARRI_TEST_SUITE, testing_support::operation(#SYMBOL), [] { \
    TEST_##SHAPE(testing_support::operation(#SYMBOL), &KASTARRI_SYMBOL(SYMBOL), __VA_ARGS__);                          \
  });

#define TEST_float_a_r(NAME, F, T, K) testing_support::drive_float_a_r(NAME, model_##K, F)
#define TEST_float_a_r_T(NAME, F, T, P, K) testing_support::drive_float_a_r_T(NAME, model_##K, F)
#define TEST_w_r(NAME, F, R, A, K) testing_support::drive_float_a_r(NAME, model_##K, F)
#define TEST_ab_r(NAME, F, T, K) testing_support::drive_float_ab_r(NAME, model_##K, F)
#define TEST_ab_r_T(NAME, F, T, P, K) testing_support::drive_float_ab_r_T(NAME, model_##K, F)
#define TEST_ab_p(NAME, F, P, T, K) testing_support::drive_float_relation(NAME, model_##K, F)
#define TEST_float_acc_ab(NAME, F, T, K) testing_support::drive_float_acc_ab(NAME, model_##K, F)
#define TEST_float_acc_ab_T(NAME, F, T, P, K) testing_support::drive_float_acc_ab_T(NAME, model_##K, F)
#define TEST_float_const(NAME, F, T, K) testing_support::drive_float_const(NAME, F)

#include "float/row_kinds.h"
#include "frame/rows.h"

namespace {
