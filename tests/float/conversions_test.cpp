#include "float/drivers.h"
#include "frame/convert.h"

namespace testing_support {

// A conversion of one register to another, to the other's lane 0, or from it into every lane.
template <class From, class To>
void drive_rtor(const char* name, To (*f)(const From&)) {
  using L = layout_of<From>;
  using R = layout_of<To>;
  using Lane = Layout<typename L::container, L::bits, 1, typename L::number>;
  using Result = Layout<typename R::container, R::bits, 1, typename R::number>;
  const auto answer = [](int mode, Int value) { return converted<L, R>(mode, value, 0); };
  if constexpr (L::count == R::count) {
    check_conversion<L, R>(name, values_of<L>(1), answer,
                           [f](const Register* x, Register& r) { write_image(f(as_register<From>(x[0].bytes)), r); });
  } else {
    check_conversion<Lane, Result>(name, values_of<L>(1), answer, [f](const Register* x, Register& r) {
      From from = filled<From>(0x7D);  // signalling NaNs in the other lanes, which are not read
      set_lane<L>(from._, 0, lane<L>(x[0].bytes, 0));
      const To to = f(from);
      write_image(to, r);
      for (int i = 1; i < R::count; ++i) ASSERT_EQ(lane<R>(to._, i), lane<R>(to._, 0));
    });
  }
}

// A float by value passes through the x87 unit, which is the platform's way: only bits that survive it.
template <class H>
constexpr bool survives(Int value) {
  return !std::is_same_v<H, float> || !exact::single.signalling(static_cast<Bits>(value));
}

template <class H, class To>
void drive_from_host(const char* name, To (*f)(H)) {
  using L = host_layout<H>;
  using R = layout_of<To>;
  for (int mode = 0; mode < 4; ++mode) {
    for (const Case& x : values_of<L>(1)) {
      const Int value = as_lane<L>(static_cast<Int>(x[0]));
      if (!survives<H>(value)) continue;
      H host;
      std::memcpy(&host, x.data(), sizeof host);
      const exact::Answer expected = converted<L, R>(mode, value, 0);
      FloatState state(mode);
      const To r = f(host);
      ASSERT_EQ(state.flags(), expected.flags) << name << ' ' << value;
      for (int i = 0; i < R::count; ++i)
        ASSERT_EQ(static_cast<Bits>(lane<R>(r._, i)), expected.bits) << name << ' ' << value;
    }
  }
}

template <class From, class H>
void drive_to_host(const char* name, H (*f)(const From&)) {
  using L = layout_of<From>;
  using R = host_layout<H>;
  for (int mode = 0; mode < 4; ++mode) {
    for (const Case& x : values_of<L>(1)) {
      From from = filled<From>(0x7D);
      set_lane<L>(from._, 0, static_cast<Int>(x[0]));
      const exact::Answer expected = converted<L, R>(mode, lane<L>(from._, 0), 0);
      FloatState state(mode);
      const H host = f(from);
      ASSERT_EQ(state.flags(), expected.flags) << name << ' ' << x[0];
      Register r = {};
      write_image(host, r);
      ASSERT_EQ(lane<R>(r.bytes, 0), as_lane<R>(static_cast<Int>(expected.bits))) << name << ' ' << x[0];
    }
  }
}

// Half lanes 2i + which of the vector against singles.
template <class R, class A>
void drive_every_other(const char* name, R (*f)(const A&), int which) {
  if constexpr (std::is_same_v<R, qv_vecN_2xf32>) {
    check_conversion<f16x16, f32x16>(
        name, values_of<f16x1>(1), [](int mode, Int v) { return converted<f16x16, f32x16>(mode, v, 0); },
        [=](const Register* x, Register& r) {
          A a = filled<A>(0x7D);
          for (int i = 0; i < 16; ++i) set_lane<f16x32>(a._, 2 * i + which, lane<f16x16>(x[0].bytes, i));
          write_image(f(a), r);
        });
  } else {
    check_conversion<f32x16, f16x16>(
        name, values_of<f32x1>(1), [](int mode, Int v) { return converted<f32x16, f16x16>(mode, v, 0); },
        [=](const Register* x, Register& r) {
          const R halves = f(as_register<A>(x[0].bytes));
          for (int i = 0; i < 16; ++i) {
            set_lane<f16x16>(r.bytes, i, lane<f16x32>(halves._, 2 * i + which));
            ASSERT_EQ(lane<f16x32>(halves._, 2 * i + 1 - which), 0) << name;
          }
        });
  }
}

template <class R, class A>
void drive_format(const char* name, R (*f)(const A&)) {
  const int length = static_cast<int>(std::strlen(name));
  if constexpr (layout_of<A>::count > 1) {
    drive_every_other(name, f, name[length - 1] - '0');
  } else {
    drive_rtor(name, f);
  }
}

}  // namespace testing_support

namespace {

// Signalling NaNs keep their bits on every way that does not change the number.
TEST(float_moves, KeepSignallingNaNs) {
  using namespace testing_support;
  rkfloat x;
  x._[0] = 0x7FA12345;
  FloatState state(0);
  const qv_vecN_2xf32 v = x;
  const rkfloat back = v, copy = KASTARRI_SYMBOL(rk_zran_scalarfp_MOV_S)(back);
  EXPECT_EQ(copy._[0], 0x7FA12345u);
  EXPECT_EQ(v._[15], 0x7FA12345u);
  qv_f16 h;
  h._[0] = 0x7D01;
  const qv_vecNxf16 w = h;
  const qv_f16 half = w;
  EXPECT_EQ(half._[0], 0x7D01);
  EXPECT_EQ(w._[15], 0x7D017D01u);
  EXPECT_EQ(state.flags(), 0u);
}

}  // namespace

#define KASTARRI_TEST_SUITE "float_conversions"
#include "float/drivers_begin.h"

#define KERNEL_convert_scaled(OP, FROM, TO, INTEGER)
#define KERNEL_convert(OP, FROM, TO)
#define KERNEL_convert_from_every_other(OP, FIRST)
#define KERNEL_convert_to_every_other(OP, FIRST)

#undef TEST_w_r
#define TEST_w_r(NAME, F, R, A, K) testing_support::drive_format(NAME, F)
#define TEST_float_scaled(NAME, F, R, A, K) testing_support::drive_float_scaled(NAME, F)
#define TEST_rtor(NAME, F, FROM, TO) testing_support::drive_rtor(NAME, F)
#define TEST_from_host(NAME, F, H, TO) testing_support::drive_from_host(NAME, F)
#define TEST_to_host(NAME, F, FROM, H) testing_support::drive_to_host(NAME, F)

#include "float/conversions.def"
#include "float/scaled.def"

#include "support/drivers_end.h"
