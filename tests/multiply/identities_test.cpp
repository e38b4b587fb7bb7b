// What holds between intrinsics, whatever their models say.
#include <gtest/gtest.h>

#include "kastarri/multiply.h"
#include "support/operands.h"

#define ZRA(OP) KASTARRI_SYMBOL(rk_zra32_ZRA_##OP)

namespace {

using namespace testing_support;

class Identities : public testing::Test {
 protected:
  template <class T>
  T random() {
    T v;
    fill_random<layout_of<T>>(v._, random_);
    return v;
  }

  template <class Check>
  void repeat(Check check) {
    for (int n = 0; n < 200 && !HasFatalFailure(); ++n) check();
  }

 private:
  std::mt19937 random_{seed};
};

// Two 16 x 32 products, the upper one placed 16 bits up, make the exact 32 x 32 product.
TEST_F(Identities, partial_products_make_the_whole) {
  repeat([&] {
    const auto x = random<qv_vecN_2x32v>(), y = random<qv_vecN_2x32v>();
    qv_vecN_2x64w sum = ZRA(MULUSN_2X16X32_0)(as_register<qv_vecNx16U>(x._), y);
    ZRA(MULAHN_2X16X32_1)(sum, as_register<qv_vecNx16>(x._), y);
    for (int j = 0; j < 16; ++j)
      ASSERT_EQ(lane<i64x16>(sum._, j), lane<i32x16>(x._, j) * lane<i32x16>(y._, j)) << "lane " << j;
    ASSERT_TRUE(same_bits(sum, ZRA(MULN_2X32)(x, y)));
  });
}

TEST_F(Identities, a_packed_product_is_the_narrow_product) {
  repeat([&] {
    const auto a = random<qv_vecNx16>(), b = random<qv_vecNx16>();
    const qv_vecNx48 product = ZRA(MULNX16)(a, b);
    ASSERT_TRUE(same_bits(ZRA(PACKQNX48)(product), ZRA(MULNX16PACKQ)(a, b)));
    ASSERT_TRUE(same_bits(ZRA(PACKPNX48)(product), ZRA(MULNX16PACKP)(a, b)));
    ASSERT_TRUE(same_bits(ZRA(PACKLNX48)(product), ZRA(MULNX16PACKL)(a, b)));
  });
}

// acc + fresh by hand, modulo the lane; then the subtracting form takes it back.
template <class W, class Fresh, class Add, class Subtract, class... Operands>
void expect_kinds_agree(const W& old, Fresh fresh, Add add, Subtract subtract, const Operands&... operands) {
  using L = layout_of<W>;
  const W product = fresh(operands...);
  W acc = old, expected = old;
  add(acc, operands...);
  for (int i = 0; i < L::count; ++i) {
    const auto sum = static_cast<std::uint64_t>(lane<L>(old._, i)) + static_cast<std::uint64_t>(lane<L>(product._, i));
    set_lane<L>(expected._, i, static_cast<Int>(sum));
  }
  ASSERT_TRUE(same_bits(acc, expected));
  subtract(acc, operands...);
  ASSERT_TRUE(same_bits(acc, old));
}

TEST_F(Identities, accumulating_adds_and_subtracting_undoes) {
  repeat([&] {
    const auto a = random<qv_vecNx16>(), b = random<qv_vecNx16>(), c = random<qv_vecNx16>(), d = random<qv_vecNx16>();
    const auto e = random<qv_vec2Nx8>(), f = random<qv_vec2Nx8>();
    const auto x = random<qv_vecN_2x32v>(), y = random<qv_vecN_2x32v>();
    const auto wide = random<qv_vecNx48>();
    const auto longs = random<qv_vecN_2x64w>();
    expect_kinds_agree(wide, ZRA(MULNX16), ZRA(MULANX16), ZRA(MULSNX16), a, b);
    expect_kinds_agree(wide, ZRA(MULPNX16), ZRA(MULPANX16), ZRA(MULPSNX16), a, b, c, d);
    expect_kinds_agree(wide, ZRA(MULNX16C), ZRA(MULANX16C), ZRA(MULSNX16C), a, b);
    expect_kinds_agree(wide, ZRA(ADDWNX16), ZRA(ADDWANX16), ZRA(ADDWSNX16), a, b);
    expect_kinds_agree(wide, ZRA(SUBWUNX16), ZRA(SUBWUANX16), ZRA(SUBWUSNX16), qv_vecNx16U(a), qv_vecNx16U(b));
    expect_kinds_agree(random<qv_vec2Nx24>(), ZRA(SUBW2NX8), ZRA(SUBWA2NX8), ZRA(SUBWS2NX8), e, f);
    expect_kinds_agree(wide, ZRA(SQRPNX16), ZRA(SQRPANX16), ZRA(SQRPSNX16), a, b);
    expect_kinds_agree(random<qv_vec2Nx24>(), ZRA(MUL2NX8), ZRA(MULA2NX8), ZRA(MULS2NX8), e, f);
    expect_kinds_agree(longs, ZRA(MULN_2X32), ZRA(MULAN_2X32), ZRA(MULSN_2X32), x, y);
    expect_kinds_agree(longs, ZRA(MULHN_2X16X32_1), ZRA(MULAHN_2X16X32_1), ZRA(MULSHN_2X16X32_1), a, x);
    expect_kinds_agree(longs, ZRA(MULN_2X32C), ZRA(MULAN_2X32C), ZRA(MULSN_2X32C), x, y);
  });
}

TEST_F(Identities, squares_are_products_of_equal_factors) {
  repeat([&] {
    const auto a = random<qv_vecNx16>(), b = random<qv_vecNx16>();
    const auto u = random<qv_vecNx16U>(), v = random<qv_vecNx16U>();
    const auto e = random<qv_vec2Nx8>(), f = random<qv_vec2Nx8>();
    ASSERT_TRUE(same_bits(ZRA(SQRPNX16)(a, b), ZRA(MULPNX16)(a, a, b, b)));
    ASSERT_TRUE(same_bits(ZRA(SQRPDNX16)(a, b), ZRA(MULPDNX16)(a, a, b, b)));
    ASSERT_TRUE(same_bits(ZRA(SQRUPNX16U)(u, v), ZRA(MULUUPNX16)(u, u, v, v)));
    ASSERT_TRUE(same_bits(ZRA(SQRP2NX8)(e, f), ZRA(MULP2NX8)(e, e, f, f)));
  });
}

// A number times the conjugate of itself is real: its squared magnitude.
TEST_F(Identities, a_number_times_its_conjugate_is_its_squared_magnitude) {
  repeat([&] {
    const auto z = random<qv_vecNx16>();
    const qv_vecNx48 product = ZRA(MULNX16J)(z, z);
    for (int k = 0; k < 16; ++k) {
      const Int re = lane<i16x32>(z._, 2 * k), im = lane<i16x32>(z._, 2 * k + 1);
      ASSERT_EQ(lane<i48x32>(product._, 2 * k), re * re + im * im);
      ASSERT_EQ(lane<i48x32>(product._, 2 * k + 1), 0);
    }
  });
}

}  // namespace
