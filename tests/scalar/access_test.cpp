// Loads and stores of the scalar core, by their rows: at every place of a page, with offsets of either sign by which
// addresses wrap; and the failure at addresses that are not aligned, before the memory is touched.
#include "memory/drivers.h"
#include "scalar/drivers.h"

namespace model {

// What a row moves.
struct Moved {
  unsigned bytes;
  bool has_sign = false;  // which a load extends
};
constexpr Moved rk_core_L32I{4, true}, rk_density_L32I_N{4, true}, rk_core_uint32_loadi{4};
constexpr Moved rk_core_L16UI{2}, rk_core_L16SI{2, true}, rk_core_L8UI{1};
constexpr Moved rk_core_S32I{4}, rk_density_S32I_N{4}, rk_core_S32NB{4}, rk_core_uint32_storei{4};
constexpr Moved rk_core_S16I{2}, rk_core_S8I{1};

}  // namespace model

namespace {

using namespace testing_support;

// The number in memory, least significant byte first.
Int number_at(const unsigned char* memory, const model::Moved& moved) {
  Int value = 0;
  for (unsigned i = moved.bytes; i-- > 0;) value = value * 256 + memory[i];
  const Int range = Int{1} << 8 * moved.bytes;
  return moved.has_sign && value >= range / 2 ? value - range : value;
}

// access(base, offset) at addresses that are not aligned, in memory that may not be touched. Base and offset can each
// be aligned or not: their sum counts.
template <class T, class Access>
void expect_failures(const char* name, unsigned alignment, Access access) {
  const Memory memory;
  for (const auto& [base_part, offset] : {std::pair{0, 1}, {1, 0}, {1, -2}, {2, 1}, {0, 2}, {3, 3}}) {
    const auto* base = moved<const T>(memory.forbidden(), base_part);
    const auto* address = moved<const void>(base, offset);
    if (address_of(address) % alignment != 0) expect_failure(name, address, [&, by = offset] { access(base, by); });
  }
}

template <class R, class T>
void drive(const char* name, const model::Moved& moved, R (*load)(const T*, int)) {
  Memory memory;
  std::mt19937 random(seed);
  for (unsigned place : places(moved.bytes, moved.bytes)) {
    memory.fill(random);
    const auto before = memory.copy();
    for (int offset : steps)
      EXPECT_EQ(Int{load(moved_back<const T>(memory.begin() + place, offset), offset)},
                number_at(&before[place], moved))
          << name << " at " << place << " with offset " << offset;
    memory.expect(before, name);
  }
  expect_failures<T>(name, moved.bytes, load);
}

template <class V, class T>
void drive(const char* name, const model::Moved& moved, void (*store)(V, const T*, int)) {
  Memory memory;
  std::mt19937 random(seed);
  for (unsigned place : places(moved.bytes, moved.bytes)) {
    memory.fill(random);
    for (int offset : steps) {
      auto expected = memory.copy();
      const V value = static_cast<V>(random());
      for (unsigned i = 0; i < moved.bytes; ++i) expected[place + i] = static_cast<unsigned char>(Int{value} >> 8 * i);
      store(value, moved_back<const T>(memory.begin() + place, offset), offset);
      memory.expect(expected, name);
    }
    if (testing::Test::HasFatalFailure()) return;
  }
  expect_failures<T>(name, moved.bytes, [=](const T* base, int offset) { store(1, base, offset); });
}

#define ENTRY(SYMBOL, SHAPE, ...) \
  const int tested_##SYMBOL =     \
      add_test("AccessDeathTest", #SYMBOL, [] { drive(#SYMBOL, model::SYMBOL, &KASTARRI_SYMBOL(SYMBOL)); });

#include "frame/rows.h"

#include "scalar/access.def"

#include "frame/rows_end.h"

TEST(AccessAddressDeathTest, ReportsTheAddressItIsGiven) {
  const auto load = &KASTARRI_SYMBOL(rk_core_L32I);
  const auto* low = reinterpret_cast<const int*>(0x1000);
  const auto* last = reinterpret_cast<const int*>(UINTPTR_MAX);
  expect_failure("low", moved<const void>(low, 2), [=] { (void)load(low, 2); });
  expect_failure("whole", moved<const void>(last, -1), [=] { (void)load(last, -1); });
  expect_failure("high", reinterpret_cast<const void*>(0xFFFFFFFF), [] { cstub_vaddr_not_aligned(0xFFFFFFFF); });
}

}  // namespace
