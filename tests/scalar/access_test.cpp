// Loads and stores of the scalar core: every width at every offset, and the failure at addresses that are
// not aligned, before the memory is touched.
#include "kastarri/scalar.h"
#include "support/addresses.h"
#include "support/drivers.h"

namespace {

using namespace testing_support;

constexpr int SIZE = 32;

// Memory, aligned to 4, with a different number in every byte.
struct Bytes {
  alignas(4) unsigned char at[SIZE];
  Bytes() {
    for (int i = 0; i < SIZE; ++i) at[i] = static_cast<unsigned char>(0x7B * i + 0x81);
  }
};

// The little-endian number in `size` bytes at the offset, with or without sign.
Int number_at(const Bytes& bytes, int offset, int size, bool with_sign) {
  Int value = 0;
  for (int i = size; i-- > 0;) value = value * 256 + bytes.at[offset + i];
  const Int range = Int{1} << 8 * size;
  return with_sign && value >= range / 2 ? value - range : value;
}

// The base is the middle of the memory: offsets have both signs.
template <class R, class T>
void expect_loads(const char* name, R (*load)(const T*, int), bool with_sign) {
  constexpr int size = sizeof(T);
  Bytes bytes;
  const auto* base = reinterpret_cast<const T*>(bytes.at + SIZE / 2);
  for (int offset = -SIZE / 2; offset <= SIZE / 2 - size; offset += size)
    EXPECT_EQ(Int{load(base, offset)}, number_at(bytes, SIZE / 2 + offset, size, with_sign))
        << name << " at " << offset;
}

template <class V, class T>
void expect_stores(const char* name, void (*store)(V, const T*, int)) {
  constexpr int size = sizeof(T);
  for (int offset = -SIZE / 2; offset <= SIZE / 2 - size; offset += size) {
    Bytes stored, expected;
    const V value = static_cast<V>(0xFEDC5432u + static_cast<unsigned>(offset));
    for (int i = 0; i < size; ++i)
      expected.at[SIZE / 2 + offset + i] = static_cast<unsigned char>(static_cast<Int>(value) >> 8 * i);
    store(value, reinterpret_cast<const T*>(stored.at + SIZE / 2), offset);
    EXPECT_EQ(std::memcmp(stored.at, expected.at, SIZE), 0) << name << " at " << offset;
  }
}

// What an access at an address that is not aligned does, on a page that may not be touched: the line, the
// status, and no fault.
template <class Access>
void expect_failure(const char* name, std::uintptr_t address, const Access& access) {
  EXPECT_EXIT(access(), testing::ExitedWithCode(1), testing::Eq(not_aligned_message(address))) << name;
}

class AccessDeathTest : public testing::Test {
 protected:
  AccessDeathTest() : page_(new_pages(SIZE_OF_PAGE)) {}
  ~AccessDeathTest() override { munmap(page_, SIZE_OF_PAGE); }

  // Base and offset can each be aligned or not: their sum counts.
  template <class T, class Access>
  void expect_failures(const char* name, const Access& access) {
    for (const auto& [base_part, offset] : {std::pair{0, 1}, {1, 0}, {1, -2}, {2, 1}, {0, 2}, {3, 3}}) {
      const auto* pointer = moved<const T>(page_, 1024 + base_part);
      const auto address = address_of(moved<void>(pointer, offset));
      if (address % sizeof(T) != 0) expect_failure(name, address, [&, by = offset] { access(pointer, by); });
    }
  }

  static constexpr std::size_t SIZE_OF_PAGE = 4096;
  void* page_;
};

#define CORE(OP) cstub_Km_ZNB_Orbis_R5_64k__KOR_rk_core_##OP
#define DENSITY(OP) cstub_Km_ZNB_Orbis_R5_64k__KOR_rk_density_##OP

TEST(Access, LoadsExtendWhatIsThere) {
  expect_loads("L32I", CORE(L32I), true);
  expect_loads("L32I_N", DENSITY(L32I_N), true);
  expect_loads("uint32_loadi", CORE(uint32_loadi), false);
  expect_loads("L16UI", CORE(L16UI), false);
  expect_loads("L16SI", CORE(L16SI), true);
  expect_loads("L8UI", CORE(L8UI), false);
}

TEST(Access, StoresWriteTheirBytesAndNoOthers) {
  expect_stores("S32I", CORE(S32I));
  expect_stores("S32I_N", DENSITY(S32I_N));
  expect_stores("S32NB", CORE(S32NB));
  expect_stores("uint32_storei", CORE(uint32_storei));
  expect_stores("S16I", CORE(S16I));
  expect_stores("S8I", CORE(S8I));
}

// Offsets are signed and addresses wrap, where memory begins and ends as at each multiple of 4 GiB.
TEST(Access, AddressesWrap) {
  constexpr std::size_t size = 8192;
  unsigned char* const pages = new_pages(size);
  mprotect(pages, size, PROT_READ | PROT_WRITE);
  for (int place = 4096 - 64; place < 4096 + 64; place += 4) {
    for (int offset : {std::numeric_limits<int>::min(), -4096, -4, 0, 4, 4096, std::numeric_limits<int>::max()}) {
      const int number = 0x1234567 ^ offset ^ place;
      CORE(S32I)(number, moved_back<const int>(pages + place, offset), offset);
      EXPECT_EQ(CORE(L32I)(moved_back<const int>(pages + place, offset), offset), number) << place << ' ' << offset;
      EXPECT_EQ(std::memcmp(pages + place, &number, sizeof number), 0) << place << ' ' << offset;
    }
  }
  munmap(pages, size);
}

TEST_F(AccessDeathTest, LoadsNeedTheirAlignment) {
  expect_failures<int>("L32I", CORE(L32I));
  expect_failures<int>("L32I_N", DENSITY(L32I_N));
  expect_failures<unsigned>("uint32_loadi", CORE(uint32_loadi));
  expect_failures<unsigned short>("L16UI", CORE(L16UI));
  expect_failures<short>("L16SI", CORE(L16SI));
}

TEST_F(AccessDeathTest, StoresNeedTheirAlignment) {
  const auto storing = [](auto store) { return [=](auto pointer, int offset) { store(1, pointer, offset); }; };
  expect_failures<int>("S32I", storing(CORE(S32I)));
  expect_failures<int>("S32I_N", storing(DENSITY(S32I_N)));
  expect_failures<int>("S32NB", storing(CORE(S32NB)));
  expect_failures<unsigned>("uint32_storei", storing(CORE(uint32_storei)));
  expect_failures<short>("S16I", storing(CORE(S16I)));
}

TEST_F(AccessDeathTest, ReportsTheAddressItIsGiven) {
  expect_failure("low", 0x1002, [] { (void)CORE(L32I)(reinterpret_cast<const int*>(0x1000), 2); });
  expect_failure("high", 0xFFFFFFFF, [] { cstub_vaddr_not_aligned(0xFFFFFFFF); });
  expect_failure("whole", UINTPTR_MAX - 1, [] { (void)CORE(L32I)(reinterpret_cast<const int*>(UINTPTR_MAX), -1); });
}

}  // namespace
