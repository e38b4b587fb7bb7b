// What the public header of lanes makes of numbers: halves rounded, lanes extended, registers compared. What it reads
// from every type, tests/print/lanes_test.py compares with Python.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <random>
#include <vector>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

namespace {

using namespace kastarri;

// Rounded to the nearest as the core does when its mode is 0: on every half, midway between two, and a unit beside
// that.
TEST(PublicLanes, HalvesAreRoundedAsTheCoreDoes) {
  const auto check = [](unsigned bits) {
    float value;
    std::memcpy(&value, &bits, sizeof value);
    qv_vecNxf16 half = ZRA_ZERONX16();
    set_lane(half, 0, value);
    const qv_vecNxf16 core = ZRA_CVTF16N_2XF32_0(from_lanes<qv_vecN_2xf32>({value}));
    if (std::isnan(value)) return std::isnan(lane(half, 0));
    return lane_bits(half, 0) == lane_bits(core, 0);
  };
  for (unsigned half = 0; half < 0x10000; ++half) {
    qv_f16 h;
    set_lane_bits(h, 0, half);
    const float value = lane(h, 0);
    set_lane(h, 0, value);
    ASSERT_EQ(lane_bits(h, 0), std::isnan(value) ? half | 0x200 : half);
    const auto exact = static_cast<unsigned>(lane_bits(from_lanes<rkfloat>({value}), 0));
    const bool subnormal = (half & 0x7c00) == 0;
    const unsigned midway = subnormal ? 0 : 0x1000;  // in units of the single
    for (const unsigned beside : {0u, 1u, ~0u}) ASSERT_TRUE(check(exact + midway + beside)) << std::hex << half;
  }
  std::mt19937 random(5);
  for (int n = 0; n < 200000; ++n) ASSERT_TRUE(check(static_cast<unsigned>(random())));
  // Midway between subnormals, and between the largest one and the smallest normal number.
  for (int n = 0; n < 1024; ++n) {
    for (const float units : {n + 0.5f, std::nextafter(n + 0.5f, 0.0f), std::nextafter(n + 0.5f, 2000.0f)}) {
      const auto bits = static_cast<unsigned>(lane_bits(from_lanes<rkfloat>({std::ldexp(units, -24)}), 0));
      ASSERT_TRUE(check(bits)) << units;
    }
  }
}

TEST(PublicLanes, AreExtendedAsTheCoreHasThem) {
  qv_vecNx48 acc = ZRA_ZERONX48();
  set_lane(acc, 3, -1);
  EXPECT_EQ(lane_bits(acc, 3), 0xffffffffffffu);
  EXPECT_EQ(acc._[6] & acc._[7], 0xffffffffu);
  set_lane(acc, 3, std::int64_t{1} << 47);  // takes the low 48 bits
  EXPECT_EQ(lane(acc, 3), -(std::int64_t{1} << 47));
  qv_vec2Nx24 narrow = ZRA_ZERO2NX24();
  set_lane(narrow, 63, 0x800000);
  EXPECT_EQ(narrow._[63], 0xff800000u);
  EXPECT_EQ(lane(narrow, 62), 0);
}

TEST(PublicLanes, AreComparedByTheirBits) {
  const auto floats = [](float first) { return from_lanes<qv_vecN_2xf32>({first}); };
  EXPECT_FALSE(equal(floats(0.0f), floats(-0.0f)));
  EXPECT_TRUE(equal(floats(std::numeric_limits<float>::quiet_NaN()), floats(std::numeric_limits<float>::quiet_NaN())));
  // What lies beside the lanes does not count: here the upper byte of a word, the upper half of a byte.
  qv_vec2Nx24 a = ZRA_ZERO2NX24(), b = a;
  b._[5] = 0x7f000000;
  EXPECT_TRUE(equal(a, b));
  rkbool4 p = from_lanes<rkbool4>({true, false, true, true}), q = p;
  q._[0] = static_cast<unsigned char>(q._[0] | 0xf0);
  EXPECT_TRUE(equal(p, q));
  set_lane(q, 1, true);
  EXPECT_FALSE(equal(p, q));
}

TEST(PublicLanes, ComeFromWhateverHoldsNumbers) {
  const short array[] = {3, -4, 5};
  const auto v = from_lanes<qv_vecNx16>(array);
  EXPECT_TRUE(equal(v, from_lanes<qv_vecNx16>(std::vector<int>{3, -4, 5})));
  EXPECT_TRUE(equal(v, from_lanes<qv_vecNx16>({3, -4, 5})));
  EXPECT_TRUE(equal(v, by_lane<qv_vecNx16>([&](int i) { return i < 3 ? array[i] : 0; })));
  const auto wide = from_lanes<qv_vecN_8x128>({Lane<qv_vecN_8x128>{{1, 2, 3, 4}}});
  EXPECT_EQ(wide._[2], 3u);

  const auto coefficients = from_parts<qv_int32pr, short>({-1, 3});
  EXPECT_EQ(coefficients._[0], 0x0003ffffu);
  EXPECT_EQ(parts<signed char>(coefficients), (std::array<signed char, 4>{{-1, -1, 3, 0}}));
}

}  // namespace
