// Conversions between registers and from and to host scalars: the exported function, and with it the
// constructor, assignment and conversion operator, which all have to give the same bits.
#include <climits>

#include "support/drivers.h"

namespace {

using namespace testing_support;

template <class L>
constexpr bool is_spill = std::is_same_v<L, packed1536>;

// Lane i of a wide register, found bit by bit in its packed image.
template <class Wide>
void unpack(const void* image, void* wide) {
  const auto* bytes = static_cast<const unsigned char*>(image);
  for (int i = 0; i < Wide::count; ++i) {
    Int value = 0;
    for (int b = Wide::bits; b-- > 0;) {
      const int bit = i * Wide::bits + b;
      value = 2 * value + (bytes[bit / 8] >> (bit % 8) & 1);
    }
    set_lane<Wide>(wide, i, value);
  }
}

template <class From, class To>
To expected_register(const From& from) {
  using F = layout_of<From>;
  using T = layout_of<To>;
  To to = filled<To>(0);
  if constexpr (is_spill<F>) {
    unpack<T>(from._, to._);
  } else if constexpr (is_spill<T>) {
    auto* bytes = reinterpret_cast<unsigned char*>(to._);
    for (int bit = 0; bit < 1536; ++bit)
      if (lane<F>(from._, bit / F::bits) >> (bit % F::bits) & 1)
        bytes[bit / 8] = static_cast<unsigned char>(bytes[bit / 8] | 1 << bit % 8);
  } else {
    for (int i = 0; i < T::count; ++i) set_lane<T>(to._, i, lane<F>(from._, F::count == T::count ? i : 0));
  }
  return to;
}

template <class From, class To>
void drive_rtor(const char* name, To (*f)(const From&)) {
  std::mt19937 random(seed);
  const auto values = corners<std::conditional_t<is_spill<layout_of<From>>, i16x32, layout_of<From>>>();
  for (std::size_t n = 0; n < values.size() + 50; ++n) {
    From from;
    fill_random<layout_of<From>>(from._, random);
    if (n < values.size() && !is_spill<layout_of<From>>) set_lane<layout_of<From>>(from._, 0, values[n]);
    const To expected = expected_register<From, To>(from);
    To assigned;
    assigned = from;
    const To constructed(from);
    ASSERT_TRUE(same_bits(f(from), expected)) << name << " of lane 0 = " << lane<layout_of<From>>(from._, 0);
    ASSERT_TRUE(same_bits(constructed, expected) && same_bits(assigned, expected) &&
                same_bits(static_cast<To>(from), expected) && same_bits(from.operator To(), expected))
        << name << ": constructor, assignment and operator";
  }
}

template <class H>
std::vector<H> host_values() {
  std::vector<H> values;
  for (Int v : corners<i64x1>()) values.push_back(static_cast<H>(v));
  return values;
}

template <class H, class To>
void drive_from_host(const char* name, To (*f)(H)) {
  using T = layout_of<To>;
  for (H value : host_values<H>()) {
    To expected = filled<To>(0);
    for (int i = 0; i < T::count; ++i) set_lane<T>(expected._, i, static_cast<Int>(value));
    To assigned;
    assigned = value;
    ASSERT_TRUE(same_bits(f(value), expected) && same_bits(To(value), expected) && same_bits(assigned, expected))
        << name << " of " << static_cast<Int>(value);
  }
}

template <class From, class H>
void drive_to_host(const char* name, H (*f)(const From&)) {
  std::mt19937 random(seed);
  for (Int value : corners<layout_of<From>>()) {
    From from;
    fill_random<layout_of<From>>(from._, random);
    set_lane<layout_of<From>>(from._, 0, value);
    ASSERT_EQ(f(from), static_cast<H>(value)) << name;
  }
}

// Single precision and its register hold the same bits.
template <class From>
void drive_to_host(const char*, float (*f)(const From&)) {
  From from = filled<From>(0);
  from._[0] = 0xC2280000;
  EXPECT_EQ(f(from), -42.0f);
}
template <class To>
void drive_from_host(const char*, To (*f)(float)) {
  const To to = f(-42.0f);
  for (unsigned bits : to._) EXPECT_EQ(bits, 0xC2280000);
}

}  // namespace

#define KASTARRI_TEST_SUITE "conversions"
#define TEST_rtor(NAME, F, FROM, TO) drive_rtor(NAME, F)
#define TEST_from_host(NAME, F, H, TO) drive_from_host(NAME, F)
#define TEST_to_host(NAME, F, FROM, H) drive_to_host(NAME, F)
#include "support/drivers_begin.h"

#include "frame/conversions.def"

#include "support/drivers_end.h"

// Published values, against a mistake that the rows above and the library share.
TEST(conversions, known_values) {
  const qv_vec2Nx24 negative(0x00800000u);
  for (unsigned bits : negative._) EXPECT_EQ(bits, 0xFF800000u);

  const qv_vecNx48 all_ones(0xFFFFFFFFu);
  const qv_vecNx48 minus_one(-1);
  for (int i = 0; i < 64; i += 2) {
    EXPECT_EQ(all_ones._[i], 0xFFFFFFFFu);
    EXPECT_EQ(all_ones._[i + 1], 0u);
    EXPECT_EQ(minus_one._[i + 1], 0xFFFFFFFFu);
  }

  for (unsigned bits : qv_vecNx16(0x12345)._) EXPECT_EQ(bits, 0x23452345u);

  qv_vecNx48 wide(0);
  wide._[6] = 0x3456789A;
  wide._[7] = 0x12;
  EXPECT_EQ(qv_vecNx16U(wide)._[1], 0x789A0000u);

  EXPECT_EQ(vboolN(vbool1(1))._[0], 0xFFFFFFFFu);
  EXPECT_EQ(vboolN_2(vbool1(1))._[0], 0xFFFF);
  EXPECT_EQ(vbool2N(vbool1(3))._[1], 0xFFFFFFFFu);
  EXPECT_EQ(vboolN(vbool1(2))._[0], 0u);

  EXPECT_EQ(KASTARRI_SYMBOL(rk_zra32_qv_vecNx16_rtor_int32)(qv_vecNx16(0x8000)), -32768);
  EXPECT_EQ(static_cast<int>(rkbool4(0x1F)), 15);
}

// What is not a lane's own is not seen, and does not come back.
TEST(conversions, bits_beside_the_lanes_are_ignored) {
  qv_vecNx48 wide(-2);
  qv_vec2Nx24 bytes(-2);
  const qv_wvecspill clean48(wide), clean24(bytes);
  for (int i = 0; i < 64; ++i) bytes._[i] = (bytes._[i] & 0xFFFFFF) | 0x5A000000u;
  for (int i = 1; i < 64; i += 2) wide._[i] = (wide._[i] & 0xFFFF) | 0x5A5A0000u;
  EXPECT_TRUE(same_bits(qv_wvecspill(wide), clean48));
  EXPECT_TRUE(same_bits(qv_wvecspill(bytes), clean24));
  EXPECT_TRUE(same_bits(qv_vecNx48(qv_wvecspill(wide)), qv_vecNx48(-2)));
}
