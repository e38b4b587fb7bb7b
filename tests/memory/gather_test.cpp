// Gathers and scatters: their rows and the two helpers against one model that works on bytes.
#include <array>

#include "memory/memory.h"

namespace testing_support {

constexpr unsigned GATHER8 = 0x01, GATHER16 = 0x41, GATHER32 = 0x91;
constexpr unsigned STORE8 = 0x04, STORE16 = 0x44, STORE32 = 0x94, INCREMENT16 = 0x46, INCREMENT32 = 0x96;

// A gather's or scatter's arrays, one number a lane.
struct Elements {
  unsigned lanes, unit_bytes, bytes;  // lanes 0: the control word selects nothing
  std::vector<unsigned> offsets, masks, data;

  explicit Elements(unsigned control)
      : lanes((control >> 4) % 4 == 0   ? 32
              : (control >> 4) % 4 == 1 ? 16
                                        : 0),
        unit_bytes(lanes == 32 ? 2 : 4),
        bytes(lanes == 32 && (control >> 6) % 4 == 0 ? 1 : unit_bytes),
        offsets(32),
        masks(32, all_ones()),
        data(32) {}

  unsigned all_ones() const { return unit_bytes == 2 ? 0xFFFF : 0xFFFFFFFF; }
};

// The arrays as words, units packed.
using Words = std::array<unsigned, 16>;
Words packed(const Elements& e, const std::vector<unsigned>& numbers) {
  Words words{};
  for (unsigned i = 0; i < 64 / e.unit_bytes; ++i)
    std::memcpy(reinterpret_cast<char*>(words.data()) + i * e.unit_bytes, &numbers[i], e.unit_bytes);
  return words;
}

// The address of element i: offsets of 32 bits are signed.
std::uintptr_t address_of(const void* base, const Elements& e, unsigned i) {
  const unsigned offset = e.offsets[i];
  return address_of(e.unit_bytes == 4 ? moved<const void>(base, static_cast<int>(offset))
                                      : static_cast<const unsigned char*>(base) + offset);
}

// Number of n bytes at the address that the program gave.
unsigned number_at(const Memory& memory, const std::vector<unsigned char>& image, std::uintptr_t address, unsigned n) {
  unsigned value = 0;
  while (n-- > 0) value = value << 8 | image[address - address_of(memory.begin()) + n];
  return value;
}

Words model_gather(const Memory& memory, const void* base, const Elements& e) {
  std::vector<unsigned> out(32);
  const auto image = memory.copy();
  for (unsigned i = 0; i < e.lanes; ++i)
    if (e.masks[i]) out[i] = number_at(memory, image, address_of(base, e, i), e.bytes) & e.masks[i];
  return packed(e, out);
}

std::vector<unsigned char> model_scatter(const Memory& memory, const void* base, const Elements& e, bool increment) {
  auto image = memory.copy();
  for (unsigned i = 0; i < e.lanes; ++i) {
    if (!e.masks[i]) continue;
    const std::uintptr_t address = address_of(base, e, i);
    unsigned value = number_at(memory, image, address, e.bytes);
    value = increment ? value + e.masks[i] % 2 : (value & ~e.masks[i]) | (e.data[i] & e.masks[i]);
    for (unsigned k = 0; k < e.bytes; ++k)
      image[address - address_of(memory.begin()) + k] = static_cast<unsigned char>(value >> 8 * k);
  }
  return image;
}

// Rounds of offsets into memory: spread over all that 16 bits reach, all equal, few different, one byte
// apart, pairs from both ends. The base of 32-bit offsets is far away, so that addresses wrap, or in the middle, so
// that offsets have both signs. Disabled elements lie where memory may not be touched.
class Rounds {
 public:
  static constexpr int count = 60;
  Memory memory{17};

  const void* next(int n, Elements& e, const std::vector<bool>& enabled = std::vector<bool>(32, true)) {
    memory.fill(random);
    const bool wide = e.unit_bytes == 4;
    const unsigned range = wide ? memory.size() - 4 : 0x10000 - 4;
    const unsigned first = below(random, range - 64);
    for (unsigned i = 0; i < 32; ++i) {
      const unsigned choices[] = {below(random, range), first, first + below(random, 5), first + i,
                                  first + (i < 16 ? i : 31 - i)};
      e.offsets[i] = choices[n % 5];
      e.data[i] = static_cast<unsigned>(random()) & e.all_ones();
    }
    unsigned char* base = memory.begin();
    const int middle = -static_cast<int>(memory.size() / 2);
    const int to_base = !wide ? 0 : n % 3 ? std::numeric_limits<int>::min() : middle;
    if (n % 2 && !wide) base = memory.end() - 0xFFFF;  // the last element reads the last bytes
    for (unsigned i = 0; i < 32; ++i) {
      if (!enabled[i]) e.masks[i] = 0;
      if (!enabled[i] && wide) e.offsets[i] = memory.size() + 4 * i;
      if (!enabled[i] && !wide && n % 2) e.offsets[i] = 0xFFFF;
      if (wide) e.offsets[i] += static_cast<unsigned>(to_base);
    }
    return moved_back<void>(base, to_base);
  }

  std::mt19937 random{seed};
};

template <class V>
V vector_of(const Words& words) {
  V v;
  std::memcpy(v._, words.data(), sizeof v._);
  return v;
}

template <class... P>
std::vector<bool> lanes_of(int first, const P&... p) {
  std::vector<bool> enabled(32, true);
  for (int i = 0; i < 32; ++i)
    enabled[static_cast<std::size_t>(i)] =
        ((first + i < layout_of<P>::count && lane<layout_of<P>>(p._, first + i)) && ...);
  return enabled;
}

// gather(base, offsets, p ...)
template <class O, class... P, class Gather>
void expect_gathers(const std::string& name, unsigned control, Gather gather) {
  Rounds rounds;
  for (int n = 0; n < Rounds::count; ++n) {
    Elements e(control);
    const auto check = [&](const P&... p) {
      const void* base = rounds.next(n, e, lanes_of(0, p...));
      const auto got = gather(base, vector_of<O>(packed(e, e.offsets)), p...);
      EXPECT_TRUE(same_bits(got, vector_of<qv_gsr>(model_gather(rounds.memory, base, e))))
          << name << " [" << cstub_Km_ZNB_Orbis_R5_64k_target() << "] round " << n;
    };
    check(predicate<P>(n, rounds.random)...);
  }
}

template <class E, class O, class... P>
void drive_gather(const std::string& name, unsigned control, qv_gsr (*f)(const E*, const O&, const P&...)) {
  expect_gathers<O, P...>(name, control, [f](const void* base, const O& offsets, const P&... p) {
    return f(static_cast<const E*>(base), offsets, p...);
  });
}
template <class E, class O, class... P>
void drive_gather_V(const std::string& name, unsigned control, qv_gsr (*f)(const E*, const O&, int, const P&...)) {
  expect_gathers<O, P...>(name, control, [f](const void* base, const O& offsets, const P&... p) {
    return f(static_cast<const E*>(base), offsets, 5, p...);
  });
}

// Data are the lanes of V from `first` on.
template <class V, class E, class O, class... P>
void drive_scatter(const std::string& name, unsigned control, int first,
                   void (*f)(const V&, const E*, const O&, const P&...)) {
  Rounds rounds;
  using L = Layout<typename layout_of<V>::container, layout_of<V>::bits, 32>;
  for (int n = 0; n < Rounds::count; ++n) {
    Elements e(control);
    const auto check = [&](const P&... p) {
      const void* base = rounds.next(n, e, lanes_of(first, p...));
      V v = filled<V>(0xEE);
      for (unsigned i = 0; i < e.lanes; ++i) set_lane<L>(v._, first + static_cast<int>(i), e.data[i]);
      const auto expected = model_scatter(rounds.memory, base, e, false);
      f(v, static_cast<const E*>(base), vector_of<O>(packed(e, e.offsets)), p...);
      rounds.memory.expect(expected, name);
    };
    check(predicate<P>(n, rounds.random)...);
    if (testing::Test::HasFatalFailure()) return;
  }
}

template <class E, class O>
void drive_increment(const std::string& name, unsigned control, void (*f)(const E*, const O&)) {
  Rounds rounds;
  for (int n = 0; n < Rounds::count; ++n) {
    Elements e(control);
    const void* base = rounds.next(n, e);
    const auto expected = model_scatter(rounds.memory, base, e, true);
    f(static_cast<const E*>(base), vector_of<O>(packed(e, e.offsets)));
    rounds.memory.expect(expected, name);
  }
}

// Byte i of a vector from the gather register's: all of them as they are, or the low bytes of the units.
template <class V>
void drive_gathered(const std::string& name, V (*f)(const qv_gsr&)) {
  std::mt19937 random(seed);
  qv_gsr g;
  fill_random<i16x32>(g._, random);
  const V got = f(g);
  const bool low_bytes = name.find("2NX8") != std::string::npos || name.find("NX8S") != std::string::npos;
  for (unsigned i = 0; i < sizeof got._; ++i) {
    const auto byte = static_cast<int>(i);
    const Int expected = low_bytes ? (i < 32 ? lane<u8x64>(g._, 2 * byte) : 0) : lane<u8x64>(g._, byte);
    EXPECT_EQ(lane<u8x64>(got._, byte), expected) << name << " byte " << i;
  }
}
template <class V>
void drive_gathered_part(const std::string& name, void (*f)(V&, const qv_gsr&)) {
  std::mt19937 random(seed);
  qv_gsr g;
  fill_random<i16x32>(g._, random);
  V r = filled<V>(0x77);
  f(r, g);
  for (int i = 0; i < 64; ++i) EXPECT_EQ(lane<u8x64>(r._, i), i < 32 ? 0x77 : lane<u8x64>(g._, 2 * (i - 32))) << name;
}

}  // namespace testing_support

#define KASTARRI_TEST_SUITE "gather"
#include "support/drivers_begin.h"

#define KERNEL_gather(OP, O, BITS) constexpr unsigned model_##OP = testing_support::GATHER##BITS;
#define KERNEL_scatter(OP, O, ELEMENT, D)                                            \
  constexpr unsigned model_##OP = sizeof(ELEMENT) == 1   ? testing_support::STORE8   \
                                  : sizeof(ELEMENT) == 2 ? testing_support::STORE16  \
                                                         : testing_support::STORE32; \
  [[maybe_unused]] constexpr int first_##OP = 0;
#define KERNEL_scatter_high(OP, O, ELEMENT, D)             \
  constexpr unsigned model_##OP = testing_support::STORE8; \
  constexpr int first_##OP = 32;
#define KERNEL_increment(OP, O) \
  constexpr unsigned model_##OP = O::bits == 16 ? testing_support::INCREMENT16 : testing_support::INCREMENT32;

#define TEST_gather(NAME, F, E, O, K) testing_support::drive_gather(NAME, model_##K, F)
#define TEST_gather_T(NAME, F, E, O, P, K) testing_support::drive_gather(NAME, model_##K, F)
#define TEST_gather_V(NAME, F, E, O, K) testing_support::drive_gather_V(NAME, model_##K, F)
#define TEST_gather_V_T(NAME, F, E, O, P, K) testing_support::drive_gather_V(NAME, model_##K, F)
#define TEST_scatter(NAME, F, V, E, O, K) testing_support::drive_scatter(NAME, model_##K, first_##K, F)
#define TEST_scatter_T(NAME, F, V, E, O, P, K) testing_support::drive_scatter(NAME, model_##K, first_##K, F)
#define TEST_increment(NAME, F, E, O, K) testing_support::drive_increment(NAME, model_##K, F)
#define TEST_wait(NAME, F, NOTHING) (F)()

#define TEST_gathered(NAME, F, V, K) testing_support::drive_gathered(NAME, F)
#define TEST_gathered_part(NAME, F, V, K) testing_support::drive_gathered_part(NAME, F)
#define KERNEL_gathered(...)
#define KERNEL_gathered_low(...)
#define KERNEL_gathered_high(...)

#include "memory/gather.def"
#include "memory/scatter.def"

#include "support/drivers_end.h"

namespace {

using namespace testing_support;

// Every control word that means something different, with masks that enable parts of an element.
TEST(GatherHelpers, HonourEveryControlWordAndMask) {
  Rounds rounds;
  for (unsigned control = 0; control < 0x400; ++control) {
    Elements e(control | (control >= 0x200 ? 0xABCDE000 : 0));
    const void* base = rounds.next(static_cast<int>(control), e);
    for (unsigned i = 0; i < 32; ++i) {
      const unsigned masks[] = {0, e.all_ones(), below(rounds.random, e.all_ones()), 1u << rounds.random() % 16};
      e.masks[i] = masks[rounds.random() % 4];
      if (e.masks[i] == 0 && e.unit_bytes == 4) e.offsets[i] = 0x7FFFFFFF;
    }
    Words out;
    out.fill(0xDEADBEEF);
    const Words gathered = e.lanes ? model_gather(rounds.memory, base, e) : out;
    const auto offsets = packed(e, e.offsets), masks = packed(e, e.masks), data = packed(e, e.data);
    cstub_Km_ZNB_Orbis_R5_64k_do_gathera(base, offsets.data(), masks.data(), control, out.data());
    EXPECT_EQ(out, gathered) << control;
    const auto scattered = model_scatter(rounds.memory, base, e, control % 16 == 6);
    cstub_Km_ZNB_Orbis_R5_64k_do_scatter(base, offsets.data(), masks.data(), control, data.data());
    rounds.memory.expect(scattered, "control " + std::to_string(control));
    if (testing::Test::HasFatalFailure()) return;
  }
}

#define ZRA(NAME) cstub_Km_ZNB_Orbis_R5_64k__KOR_rk_zra32_ZRA_##NAME

// The byte after an 8-bit element is read, so it must be there.
TEST(GatherDeathTest, ReadsTheByteAfterAByte) {
  Memory memory;
  const auto* last = memory.end() - 1;
  const auto here = filled<qv_vecNx16U>(0);
  EXPECT_DEATH((void)ZRA(GATHERANX8U)(last, here), "");
  EXPECT_DEATH(ZRA(SCATTERNX8U)(here, last, here), "");
  EXPECT_DEATH(ZRA(SCATTER2NX8U_H)(filled<qv_vec2Nx8U>(0), last, here), "");
  const Words zeros{};
  Words masks;
  masks.fill(0xFFFFFFFF);
  EXPECT_DEATH(cstub_Km_ZNB_Orbis_R5_64k_do_scatter(last, zeros.data(), masks.data(), STORE8, zeros.data()), "");
  (void)ZRA(GATHERANX8U)(last - 1, here);
  ZRA(SCATTERNX8U)(here, last - 1, here);
}

TEST(Gather, CountsAndOrdersCollisions) {
  short cell = 0;
  ZRA(SCATTERINCNX16)(&cell, filled<qv_vecNx16U>(0));
  EXPECT_EQ(cell, 32);
  qv_vecNx16 v = filled<qv_vecNx16>(0);
  set_lane<i16x32>(v._, 3, 333);
  set_lane<i16x32>(v._, 7, 777);
  vboolN p = filled<vboolN>(0);
  p._[0] = 1u << 3 | 1u << 7;
  ZRA(SCATTERNX16T)(v, &cell, filled<qv_vecNx16U>(0), p);
  EXPECT_EQ(cell, 777);
}

// Operands are as they were before the first element is stored, which may be in an operand.
TEST(Gather, ScattersOverItsOperands) {
  qv_vecNx16U numbers, down;
  for (int i = 0; i < 32; ++i) {
    set_lane<u16x32>(numbers._, i, 100 + i);
    set_lane<u16x32>(down._, i, 2 * (31 - i));
  }
  const auto* in_numbers = reinterpret_cast<const unsigned short*>(numbers._);
  const auto* in_down = reinterpret_cast<const unsigned short*>(down._);
  ZRA(SCATTERNX16U)(numbers, in_numbers, down);
  for (int i = 0; i < 32; ++i) EXPECT_EQ(lane<u16x32>(numbers._, i), 131 - i);
  ZRA(SCATTERNX16UT)(numbers, in_down, down, filled<vboolN>(0xFF));
  for (int i = 0; i < 32; ++i) EXPECT_EQ(lane<u16x32>(down._, i), 100 + i);
}

}  // namespace
