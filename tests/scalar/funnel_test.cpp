// SAR and the shifts: every amount from 0 to 63 and every argument from -70 to 140, over the corners of the
// values, against shifts made bit by bit.

#include "kastarri/scalar.h"
#include "support/drivers.h"

#define CORE(OP) cstub_Km_ZNB_Orbis_R5_64k__KOR_rk_core_##OP

namespace {

using namespace testing_support;

unsigned& SAR = cstub_Km_ZNB_Orbis_R5_64k_proc.states.SAR;

const std::vector<unsigned>& values() {
  static const std::vector<unsigned> all = [] {
    const auto corner = corners<u32x1>();
    return std::vector<unsigned>(corner.begin(), corner.end());
  }();
  return all;
}

// Bits `from` to `from` + 31 of a value that has bit k where `bit(k)`.
template <class Bit>
unsigned gather(int from, const Bit& bit) {
  unsigned result = 0;
  for (int k = 31; k >= 0; --k) result = result * 2 + (bit(from + k) ? 1 : 0);
  return result;
}

// hi above lo, zeros above and below both.
unsigned shifted(unsigned hi, unsigned lo, int right) {
  return gather(right, [=](int k) {
    if (k < 0 || k > 63) return 0u;
    return (k < 32 ? lo >> k : hi >> (k - 32)) & 1;
  });
}

unsigned shifted_signed(unsigned v, int right) { return shifted(v > 0x7FFFFFFF ? ~0u : 0, v, right); }

TEST(Funnel, EveryAmount) {
  for (unsigned amount = 0; amount < 64; ++amount) {
    const int right = static_cast<int>(amount);
    CORE(WSR_SAR)(amount);
    for (unsigned v : values()) {
      ASSERT_EQ(CORE(SLL)(v), shifted(v, 0, right)) << "SLL " << v << " SAR " << amount;
      ASSERT_EQ(CORE(SRL)(v), shifted(0, v, right)) << "SRL " << v << " SAR " << amount;
      ASSERT_EQ(static_cast<unsigned>(CORE(SRA)(static_cast<int>(v))), shifted_signed(v, right))
          << "SRA " << v << " SAR " << amount;
      for (unsigned w : {0u, ~0u, 0x12345678u, ~v, v})
        ASSERT_EQ(CORE(SRC)(v, w), shifted(v, w, right)) << "SRC " << v << ", " << w << " SAR " << amount;
    }
    EXPECT_EQ(SAR, amount) << "a shift changed SAR";
  }
}

// Checks the result of a fused shift and the SAR that it leaves.
template <class Result>
void expect_shift(const char* name, unsigned v, int s, Result got, unsigned expected, int sar) {
  ASSERT_EQ(static_cast<unsigned>(got), expected) << name << " of " << v << " by " << s;
  ASSERT_EQ(SAR, static_cast<unsigned>(sar)) << name << " by " << s << " leaves SAR";
}

TEST(Funnel, EveryArgument) {
  for (int s = -70; s <= 140; ++s) {
    const int n = (s % 32 + 32) % 32;
    for (unsigned v : values()) {
      const int x = static_cast<int>(v);
      for (unsigned w : {0u, ~0u, 0x12345678u}) {
        expect_shift("SSAI_SRC", v, s, CORE(SSAI_SRC)(v, w, s), shifted(v, w, n), n);
        SAR = 63;
        expect_shift("SSR_SRC", v, s, CORE(SSR_SRC)(v, w, s), shifted(v, w, n), n);
      }
      SAR = 63;
      expect_shift("SSR_SRA", v, s, CORE(SSR_SRA)(x, s), shifted_signed(v, n), n);
      SAR = 63;
      expect_shift("SSR_SRL", v, s, CORE(SSR_SRL)(v, s), shifted(0, v, n), n);
      expect_shift("SSL_SLL", v, s, CORE(SSL_SLL)(v, s), shifted(0, v, -n), 32 - n);
      SAR = 63;
      expect_shift("SLLI", v, s, CORE(SLLI)(v, s), n == 0 ? 0 : shifted(0, v, -n), 63);
      expect_shift("SRAI", v, s, CORE(SRAI)(x, s), shifted_signed(v, n), 63);
      expect_shift("SRLI", v, s, CORE(SRLI)(v, s), shifted(0, v, n), 63);
    }
  }
}

TEST(Funnel, ArgumentsSetSar) {
  for (int s = -70; s <= 140; ++s) {
    const int n = (s % 32 + 32) % 32, bytes = (s % 4 + 4) % 4 * 8;
    const std::pair<void (*)(int), int> setters[] = {
        {CORE(SSR), n}, {CORE(SSAI), n}, {CORE(SSL), 32 - n}, {CORE(SSA8L), bytes}, {CORE(SSA8B), 32 - bytes}};
    for (const auto& [set, expected] : setters) {
      SAR = 63;
      set(s);
      EXPECT_EQ(SAR, static_cast<unsigned>(expected)) << "argument " << s << ", setter " << &setters[0].first - &set;
    }
  }
}

TEST(Funnel, WholeAmountsKeepSixBits) {
  for (unsigned v : values()) {
    CORE(WSR_SAR)(v);
    ASSERT_EQ(CORE(RSR_SAR)(), v % 64);
    unsigned r = ~v;
    CORE(XSR_SAR)(r);
    ASSERT_EQ(r, v % 64);
    ASSERT_EQ(SAR, 63 - v % 64);
  }
}

TEST(Funnel, ShiftLeftByNothing) {
  EXPECT_EQ(CORE(SLLI)(1, 0), 0u);
  EXPECT_EQ(CORE(SSL_SLL)(1, 0), 1u);
  CORE(SSL)(0);
  EXPECT_EQ(CORE(SLL)(0x87654321), 0x87654321u);
  CORE(SSR)(0);
  EXPECT_EQ(CORE(SLL)(0x87654321), 0u);
}

}  // namespace
