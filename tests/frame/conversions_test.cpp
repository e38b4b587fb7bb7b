// Conversions between registers and from and to host scalars: the exported function, and with it the
// constructor, assignment and conversion operator, which all have to give the same bits.
#include "frame/convert.h"
#include "support/drivers.h"

namespace {

using namespace testing_support;

// A conversion with its types erased: the image of the source to that of the result, by the exported function
// and by each form that C++ offers.
struct Conversion {
  Format from, to;
  bool from_spill, to_spill;
  std::function<std::vector<Image>(const void*)> results;
};

template <class To>
Image image_of(const To& to) {
  Image image = {};
  std::memcpy(image.bytes, to._, sizeof to._);
  return image;
}

// Bit b of lane i is bit w * i + b of an image without padding: found and set one by one.
void copy_bits(const Conversion& c, const unsigned char* from, unsigned char* to) {
  const Format& wide = c.from_spill ? c.to : c.from;
  for (int i = 0; i < wide.count; ++i) {
    Int value = c.from_spill ? 0 : lane(wide, from, i);
    for (int b = 0; b < wide.bits; ++b) {
      const int bit = i * wide.bits + b;
      if (c.from_spill)
        value |= Int{from[bit / 8] >> (bit % 8) & 1} << b;
      else if (value >> b & 1)
        to[bit / 8] = static_cast<unsigned char>(to[bit / 8] | 1 << bit % 8);
    }
    if (c.from_spill) set_lane(wide, to, i, value);
  }
}

void drive(const Conversion& c) {
  std::mt19937 random(seed);
  const std::vector<Int> values = corners(c.from);
  for (std::size_t n = 0; n < values.size() + 50; ++n) {
    Image from, expected = {};
    fill_random(c.from, from.bytes, random);
    if (n < values.size()) set_lane(c.from, from.bytes, 0, values[n]);
    if (c.from_spill || c.to_spill) {
      copy_bits(c, from.bytes, expected.bytes);
    } else {
      for (int i = 0; i < c.to.count; ++i)
        set_lane(c.to, expected.bytes, i, lane(c.from, from.bytes, c.from.count == c.to.count ? i : 0));
    }
    for (const Image& got : c.results(from.bytes))
      ASSERT_EQ(std::memcmp(got.bytes, expected.bytes, sizeof got.bytes), 0)
          << "of lane 0 = " << lane(c.from, from.bytes, 0);
  }
}

template <class From, class To>
Conversion conversion(std::function<std::vector<Image>(const void*)> results) {
  return {format_of<From>(), format_of<To>(), std::is_same_v<From, packed1536>, std::is_same_v<To, packed1536>,
          std::move(results)};
}

template <class From, class To>
void drive_rtor(To (*f)(const From&)) {
  drive(conversion<layout_of<From>, layout_of<To>>([f](const void* image) {
    const From from = as_register<From>(image);
    To assigned;
    assigned = from;
    return std::vector<Image>{image_of(f(from)), image_of(assigned), image_of(To(from)), image_of(from.operator To())};
  }));
}

template <class H, class To>
void drive_from_host(To (*f)(H)) {
  drive(conversion<host_layout<H>, layout_of<To>>([f](const void* image) {
    H value;
    std::memcpy(&value, image, sizeof value);
    To assigned;
    assigned = value;
    return std::vector<Image>{image_of(f(value)), image_of(assigned), image_of(To(value))};
  }));
}

template <class From, class H>
void drive_to_host(H (*f)(const From&)) {
  drive(conversion<layout_of<From>, host_layout<H>>([f](const void* image) {
    const H value = f(as_register<From>(image));
    Image result = {};
    std::memcpy(result.bytes, &value, sizeof value);
    return std::vector<Image>{result};
  }));
}

// Single precision and its register hold the same bits.
template <class From>
void drive_to_host(float (*f)(const From&)) {
  From from = filled<From>(0);
  from._[0] = 0xC2280000;
  EXPECT_EQ(f(from), -42.0f);
}
template <class To>
void drive_from_host(To (*f)(float)) {
  const To to = f(-42.0f);
  for (unsigned bits : to._) EXPECT_EQ(bits, 0xC2280000);
}

}  // namespace

#define KASTARRI_TEST_SUITE "conversions"
#define TEST_rtor(NAME, F, FROM, TO) drive_rtor(F)
#define TEST_from_host(NAME, F, H, TO) drive_from_host(F)
#define TEST_to_host(NAME, F, FROM, H) drive_to_host(F)
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
  EXPECT_EQ(static_cast<int>(as_register<rkbool>("\x2")), 0);
  EXPECT_EQ(static_cast<int>(as_register<rkbool>("\x3")), 1);
  EXPECT_EQ(static_cast<int>(as_register<rkbool4>("\xF5")), 5);
  qv_vecNx48 wide(-2);
  qv_vec2Nx24 bytes(-2);
  const qv_wvecspill clean48(wide), clean24(bytes);
  for (int i = 0; i < 64; ++i) bytes._[i] = (bytes._[i] & 0xFFFFFF) | 0x5A000000u;
  for (int i = 1; i < 64; i += 2) wide._[i] = (wide._[i] & 0xFFFF) | 0x5A5A0000u;
  EXPECT_TRUE(same_bits(qv_wvecspill(wide), clean48));
  EXPECT_TRUE(same_bits(qv_wvecspill(bytes), clean24));
  EXPECT_TRUE(same_bits(qv_vecNx48(qv_wvecspill(wide)), qv_vecNx48(-2)));
}
