#include "float/drivers.h"
#include "frame/convert.h"

namespace testing_support {

template <class T>
void drive_to_word(const char* name, Model_function model, unsigned (*f)(const T&)) {
  FloatCheck<layout_of<T>, u32x1>(name, 1, [f](const Register* x, Register& r) {
    write_image(f(as_register<T>(x[0].bytes)), r);
  }).run(model);
}

template <class T>
void drive_from_word(const char* name, T (*f)(unsigned)) {
  for (unsigned bits : {0u, 0x7F800001u, 0xFFFF8001u, 0x12347C01u, 0x80000000u}) {
    Bits expected = 0;
    const T r = f(bits);
    std::memcpy(&expected, r._, sizeof r._);
    EXPECT_EQ(expected, sizeof r._ == 2 ? bits % 0x10000 : bits) << name;
  }
}

template <class T, class I>
void drive_from_int(const char* name, T (*f)(I, int)) {
  check_scaled<host_layout<I>, layout_of<T>>(name, 32, [f](const void* x, int scale, Register& r) {
    I value;
    std::memcpy(&value, x, sizeof value);
    write_image(f(value, scale), r);
  });
}
template <class T, class I>
void drive_to_int(const char* name, I (*f)(const T&, int)) {
  check_scaled<layout_of<T>, host_layout<I>>(
      name, 32, [f](const void* x, int scale, Register& r) { write_image(f(as_register<T>(x), scale), r); });
}

// A move under conditions of which `moves` tells what to expect.
template <class T, class Condition>
void drive_move(const char* name, void (*f)(T&, const T&, Condition), const std::vector<std::pair<int, bool>>& moves) {
  for (const auto& [condition, moved] : moves) {
    T r = filled<T>(0x11);
    const T a = filled<T>(0xFD);  // a signalling NaN in neither format's way
    std::remove_cv_t<std::remove_reference_t<Condition>> c;
    if constexpr (std::is_integral_v<decltype(c)>) {
      c = condition;
    } else {
      c._[0] = static_cast<unsigned char>(condition);
    }
    f(r, a, c);
    EXPECT_TRUE(same_bits(r, moved ? a : filled<T>(0x11))) << name << ' ' << condition;
  }
}

}  // namespace testing_support

namespace model {

const std::vector<std::pair<int, bool>> IS_TRUE = {{0, false}, {1, true}, {2, false}, {0xFF, true}};
const std::vector<std::pair<int, bool>> IS_FALSE = {{0, true}, {1, false}, {2, true}, {0xFF, false}};
const std::vector<std::pair<int, bool>> IS_ZERO = {{0, true}, {1, false}, {-1, false}, {1 << 31, false}};
const std::vector<std::pair<int, bool>> IS_NOT_ZERO = {{0, false}, {1, true}, {-1, true}, {1 << 31, true}};
const std::vector<std::pair<int, bool>> IS_NOT_NEGATIVE = {{0, true}, {1, true}, {-1, false}, {1 << 31, false}};
const std::vector<std::pair<int, bool>> IS_NEGATIVE = {{0, false}, {1, false}, {-1, true}, {1 << 31, true}};

}  // namespace model

namespace {

struct States {
  cstub_Km_ZNB_Orbis_R5_64k_states_t& states = cstub_Km_ZNB_Orbis_R5_64k_proc.states;
  ~States() { states.RoundMode = states.StickyFlags = states.StickyEnable = 0; }
};

const auto read_control = &KASTARRI_SYMBOL(rk_zran_scalarfp_RUR_FCR);
const auto write_control = &KASTARRI_SYMBOL(rk_zran_scalarfp_WUR_FCR);
const auto read_status = &KASTARRI_SYMBOL(rk_zran_scalarfp_RUR_FSR);
const auto write_status = &KASTARRI_SYMBOL(rk_zran_scalarfp_WUR_FSR);

TEST(float_control, KeepsItsBitsAlone) {
  const States s;
  for (unsigned v = 0; v < 256; ++v) {
    write_control(v | 0xFFFFFF00u);
    EXPECT_EQ(read_control(), v % 128);
    EXPECT_EQ(s.states.RoundMode, v % 4);
    EXPECT_EQ(s.states.StickyEnable, v / 4 % 32);
  }
  s.states.RoundMode = s.states.StickyEnable = 0xFFFFFFFF;  // a program may put anything there
  EXPECT_EQ(read_control(), 0x7Fu);
}

TEST(float_status, KeepsItsBitsAlone) {
  const States s;
  write_status(0x80);
  EXPECT_EQ(s.states.StickyFlags, 1u);
  EXPECT_EQ(read_status(), 0x80u);
  write_status(0xFFFFFFFF);
  EXPECT_EQ(read_status(), 0xF80u);
  write_status(0x7F);
  EXPECT_EQ(read_status(), 0u);
}

TEST(float_status, Accumulates) {
  const States s;
  rkfloat largest = 0.0f, one = 1.0f, nan = 0.0f;
  largest._[0] = 0x7F7FFFFF;
  nan._[0] = 0x7FC00000;
  write_status(0x400);
  write_control(1);
  EXPECT_EQ(KASTARRI_SYMBOL(rk_zran_scalarfp_ADD_S)(largest, largest)._[0], 0x7F7FFFFFu);
  write_control(0);
  EXPECT_EQ(KASTARRI_SYMBOL(rk_zran_scalarfp_ADD_S)(largest, largest)._[0], 0x7F800000u);
  KASTARRI_SYMBOL(rk_zran_scalarfp_ADD_S)(one, one);
  EXPECT_EQ(read_status(), 0x680u);
  EXPECT_EQ(KASTARRI_SYMBOL(rk_zran_scalarfp_TRUNC_S)(nan, 0), 0x7FFFFFFF);
  EXPECT_EQ(read_status(), 0xE80u);
}

}  // namespace

#define KASTARRI_TEST_SUITE "float_scalars"
#include "float/drivers_begin.h"

#define KERNEL_scalar_a(OP, RULE) constexpr testing_support::Model_function model_##OP = model::OP;
#define KERNEL_scalar_ab KERNEL_scalar_a
#define KERNEL_scalar_abc(OP, RULE) constexpr testing_support::Model_function model_##OP = model::RULE;
#define KERNEL_scalar_abc_to_nearest KERNEL_scalar_a
#define KERNEL_scalar_relation KERNEL_scalar_a
#define KERNEL_scalar_on_bits KERNEL_scalar_abc
#define KERNEL_scalar_move(OP, CONDITION) const auto& model_##OP = model::CONDITION;
#define KERNEL_scalar_from_bits(OP, RULE)
#define KERNEL_scalar_const(OP, RULE)
#define KERNEL_scalar_float(OP, I)
#define KERNEL_scalar_trunc(OP, I)
#define KERNEL_scalar_read(OP, RULE)
#define KERNEL_scalar_write(OP, RULE)

#define TEST_scalarfp_a_r(NAME, F, T, K) testing_support::drive_float_a_r(NAME, model_##K, F)
#define TEST_scalarfp_ab_r(NAME, F, T, K) testing_support::drive_float_ab_r(NAME, model_##K, F)
#define TEST_scalarfp_acc_ab(NAME, F, T, K) testing_support::drive_float_acc_ab(NAME, model_##K, F)
#define TEST_scalarfp_ra(NAME, F, T, K) testing_support::drive_float_ra(NAME, model_##K, F)
#define TEST_scalarfp_relation(NAME, F, T, B, K) testing_support::drive_float_relation(NAME, model_##K, F)
#define TEST_scalarfp_const(NAME, F, T, K) testing_support::drive_float_const(NAME, F)
#define TEST_scalarfp_to_word(NAME, F, T, K) testing_support::drive_to_word(NAME, model_##K, F)
#define TEST_scalarfp_from_word(NAME, F, T, K) testing_support::drive_from_word(NAME, F)
#define TEST_scalarfp_from_int(NAME, F, T, I, K) testing_support::drive_from_int(NAME, F)
#define TEST_scalarfp_to_int(NAME, F, T, I, K) testing_support::drive_to_int(NAME, F)
#define TEST_scalarfp_scaled(NAME, F, R, A, K) testing_support::drive_float_scaled(NAME, F)
#define TEST_scalarfp_move_where(NAME, F, T, K) testing_support::drive_move(NAME, F, model_##K)
#define TEST_scalarfp_move_when(NAME, F, T, K) testing_support::drive_move(NAME, F, model_##K)
#define TEST_scalarfp_read(NAME, F, K) EXPECT_EQ((*(F))(), 0u)
#define TEST_scalarfp_write(NAME, F, K) (*(F))(0)

#include "float/scalars.def"

#include "support/drivers_end.h"
