// Copies of whole registers to and from memory, and conversions between registers and memory of another type:
// every type at every misalignment, between guard bytes.
#include <algorithm>

#include "frame/convert.h"
#include "support/addresses.h"
#include "support/drivers.h"

namespace {

using namespace testing_support;

// Memory with an object somewhere in the middle; everything else must stay as it is.
class Memory {
 public:
  Memory() : now_(new_pages(size_of_pages) + size_of_pages / 2 - middle) {
    mprotect(pages(), size_of_pages, PROT_READ | PROT_WRITE);
    std::mt19937 random(seed);
    for (auto& byte : before_) byte = static_cast<unsigned char>(random());
    std::copy(std::begin(before_), std::end(before_), now_);
  }
  Memory(const Memory&) = delete;
  ~Memory() { munmap(pages(), size_of_pages); }
  unsigned char* at(int offset) { return now_ + middle + offset; }
  const unsigned char* old(int offset) const { return before_ + middle + offset; }
  bool unchanged_but(int offset, std::size_t size) const {
    const std::size_t begin = static_cast<std::size_t>(middle + offset), end = begin + size;
    return std::equal(now_, now_ + begin, before_) && std::equal(now_ + end, now_ + length, before_ + end);
  }

 private:
  static constexpr int middle = 512, length = 1280;
  static constexpr std::size_t size_of_pages = 8192;

  unsigned char* pages() const { return now_ + middle - size_of_pages / 2; }

  unsigned char before_[length];
  unsigned char* now_;
};

constexpr int offsets[] = {0, 1, 3, 64, -64, -37, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()};

// A pointer as the core has it: any address, whatever the type says.
template <class M>
M* pointer_to(const void* address) {
  return reinterpret_cast<M*>(reinterpret_cast<std::uintptr_t>(address));
}

// An access under test with its types erased: base, offset or increment, register image. Post-increment
// forms return where the pointer is afterwards.
using Access = std::function<const void*(const void* base, int offset, void* value)>;

template <class V, class M>
Access access(V (*load)(const M*, int)) {
  return [load](const void* base, int offset, void* value) {
    const V v = load(pointer_to<const M>(base), offset);
    std::memcpy(value, v._, sizeof v._);
    return base;
  };
}
template <class V, class M>
Access access(void (*load)(V&, const M**, int)) {
  return [load](const void* base, int increment, void* value) {
    const auto* pointer = pointer_to<const M>(base);
    V v;
    load(v, &pointer, increment);
    std::memcpy(value, v._, sizeof v._);
    return static_cast<const void*>(pointer);
  };
}
template <class V, class M>
Access access(void (*store)(const V&, const M*, int)) {
  return [store](const void* base, int offset, void* value) {
    store(as_register<V>(value), pointer_to<const M>(base), offset);
    return base;
  };
}
template <class V, class M>
Access access(void (*store)(const V&, M**, int)) {
  return [store](const void* base, int increment, void* value) {
    auto* pointer = pointer_to<M>(base);
    store(as_register<V>(value), &pointer, increment);
    return static_cast<const void*>(pointer);
  };
}

// Copies `bytes` bytes at every misalignment, for offsets and increments of either sign: an offset from a base that is
// as far away.
void drive_copy(std::size_t bytes, bool stores, bool increments, const Access& copy) {
  for (int misalignment = 0; misalignment < 8; ++misalignment)
    for (int offset : offsets) {
      Memory memory;
      Image value;
      std::memset(value.bytes, 0xA5, sizeof value.bytes);
      const void* at = memory.at(misalignment);
      const void* after = copy(increments ? at : moved_back<const void>(at, offset), offset, value.bytes);
      const void* expected = stores ? at : memory.old(misalignment);
      ASSERT_EQ(std::memcmp(value.bytes, expected, bytes), 0) << "at " << misalignment << " + " << offset;
      ASSERT_TRUE(memory.unchanged_but(misalignment, stores ? bytes : 0));
      if (increments) {
        ASSERT_EQ(after, moved<const void>(at, offset));
      }
    }
}

template <class T>
void drive_move(T (*f)(const T&)) {
  T from;
  std::mt19937 random(seed);
  fill_random<layout_of<T>>(from._, random);
  EXPECT_TRUE(same_bits(f(from), from));
}

// What lies on one side of a conversion: the format of its lanes, or bits packed without padding.
struct Side {
  Format format;
  int bytes;
  bool is_register;
  bool is_spill;

  // Where a conversion finds it: a host scalar's address is rounded down to its size.
  int rounded(int offset) const { return is_register ? offset : offset - ((offset % bytes) + bytes) % bytes; }
};

template <class M>
constexpr Side side_of() {
  using L = memory_layout<M>;
  return {format_of<L>(), sizeof(M), std::is_class_v<M>, std::is_same_v<L, packed1536>};
}

// Lane i of w bits in an image without padding.
Int packed_lane(const unsigned char* image, int w, int i) {
  Int value = 0;
  for (int bit = (i + 1) * w; bit-- > i * w;) value = 2 * value + (image[bit / 8] >> (bit % 8) & 1);
  return value;
}

void drive_mtor(const Side& reg, const Side& mem, const Access& load) {
  for (int offset = -9; offset <= 9; ++offset) {
    Memory memory;
    Image got = {}, expected = {};
    load(memory.at(offset / 2), offset - offset / 2, got.bytes);
    const unsigned char* element = memory.old(mem.rounded(offset));
    for (int i = 0; i < reg.format.count; ++i) {
      const Int value = mem.is_spill ? packed_lane(element, reg.format.bits, i)
                                     : lane(mem.format, element, mem.format.count == reg.format.count ? i : 0);
      set_lane(reg.format, expected.bytes, i, value);
    }
    ASSERT_EQ(std::memcmp(got.bytes, expected.bytes, sizeof got.bytes), 0) << "at " << offset;
    ASSERT_TRUE(memory.unchanged_but(0, 0));
  }
}

// What a lane becomes in memory. Narrower signed memory saturates, but for the images of accumulators.
Int stored_value(const Format& reg, const Format& mem, Int value) {
  const bool image = reg.count > 1 && reg.count == mem.count && (reg.bits == 24 || reg.bits == 48);
  if (image || mem.bits >= reg.bits || !mem.is_signed) return value;
  const Int bound = Int{1} << (mem.bits - 1);
  return std::clamp(value, -bound, bound - 1);
}

void drive_rtom(const Side& reg, const Side& mem, const Access& store) {
  std::mt19937 random(seed);
  for (Int corner : corners(reg.format)) {
    const int offset = static_cast<int>(random() % 19) - 9;
    Memory memory;
    Image value;
    fill_random(reg.format, value.bytes, random);
    set_lane(reg.format, value.bytes, 0, corner);
    store(memory.at(offset / 2), offset - offset / 2, value.bytes);
    const int element = mem.rounded(offset);
    for (int i = 0; i < (mem.is_spill ? reg.format.count : mem.format.count); ++i) {
      const Int from = lane(reg.format, value.bytes, i);
      const Int got = mem.is_spill ? as_lane(reg.format, packed_lane(memory.at(element), reg.format.bits, i))
                                   : lane(mem.format, memory.at(element), i);
      const Int expected = mem.is_spill ? from : as_lane(mem.format, stored_value(reg.format, mem.format, from));
      ASSERT_EQ(got, expected) << "lane " << i << " = " << from;
    }
    ASSERT_TRUE(memory.unchanged_but(element, static_cast<std::size_t>(mem.bytes))) << "at " << offset;
  }
}

// Lanes of 128 and 256 bits are no numbers: the bytes of the first one are copied.
void drive_whole_lane(const Side& reg, const Side& mem, bool stores, const Access& copy) {
  drive_copy(static_cast<std::size_t>(std::min(reg.bytes, mem.bytes)), stores, false, copy);
}

template <class Reg, class Mem>
void drive_conversion(bool stores, const Access& copy) {
  constexpr Side reg = side_of<Reg>(), mem = side_of<Mem>();
  if (layout_of<Reg>::bits > 64) return drive_whole_lane(reg, mem, stores, copy);
  stores ? drive_rtom(reg, mem, copy) : drive_mtor(reg, mem, copy);
}

}  // namespace

#define KASTARRI_TEST_SUITE "moves"
#define TEST_load_I(NAME, F, V, M, K) drive_copy(sizeof(V), false, false, access(F))
#define TEST_load_IP(NAME, F, V, M, K) drive_copy(sizeof(V), false, true, access(F))
#define TEST_store_I(NAME, F, V, M, K) drive_copy(sizeof(V), true, false, access(F))
#define TEST_store_IP(NAME, F, V, M, K) drive_copy(sizeof(V), true, true, access(F))
#define TEST_move(NAME, F, T) drive_move(F)
#define TEST_mtor(NAME, F, REG, MEM) drive_conversion<REG, MEM>(false, access(F))
#define TEST_rtom(NAME, F, REG, MEM) drive_conversion<REG, MEM>(true, access(F))
#include "support/drivers_begin.h"

#include "frame/memory_conversions.def"
#include "frame/moves.def"

#include "support/drivers_end.h"

// A wide register that is spilt and read back is the same register, in canonical form.
TEST(moves, spill_and_back_is_the_identity) {
  std::mt19937 random(seed);
  for (int n = 0; n < 100; ++n) {
    Memory memory;
    qv_vec2Nx24 bytes;
    qv_vecNx48 halves;
    fill_random<i24x64>(bytes._, random);
    fill_random<i48x32>(halves._, random);
    const auto* image = pointer_to<const qv_wvecspill>(memory.at(n % 8));
    KASTARRI_SYMBOL(rk_zra32_qv_vec2Nx24_rtom_qv_wvecspill)(bytes, image, 0);
    ASSERT_TRUE(same_bits(KASTARRI_SYMBOL(rk_zra32_qv_wvecspill_mtor_qv_vec2Nx24)(image, 0), bytes));
    KASTARRI_SYMBOL(rk_zra32_qv_vecNx48_rtom_qv_wvecspill)(halves, image, 0);
    ASSERT_TRUE(same_bits(KASTARRI_SYMBOL(rk_zra32_qv_wvecspill_mtor_qv_vecNx48)(image, 0), halves));
    ASSERT_TRUE(memory.unchanged_but(n % 8, sizeof(qv_wvecspill)));
  }
}

// Published values.
TEST(moves, known_values) {
  alignas(2) short memory[2] = {-2, 77};
  const auto* odd = reinterpret_cast<const short*>(reinterpret_cast<const char*>(memory) + 1);
  for (unsigned bits : KASTARRI_SYMBOL(rk_zra32_int16_mtor_qv_vecNx16)(odd, 0)._) EXPECT_EQ(bits, 0xFFFEFFFEu);
  signed char byte = 0;
  KASTARRI_SYMBOL(rk_zra32_qv_vecNx16_rtom_int8)(qv_vecNx16(300), &byte, 0);
  EXPECT_EQ(byte, 127);
  KASTARRI_SYMBOL(rk_zra32_qv_vecNx16_rtom_int8)(qv_vecNx16(-300), &byte, 0);
  EXPECT_EQ(byte, -128);
}
