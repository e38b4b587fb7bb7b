// Copies of whole registers to and from memory, and conversions between registers and memory of another type:
// every type at every misalignment, between guard bytes.
#include <algorithm>

#include "frame/convert.h"
#include "support/drivers.h"

namespace {

using namespace testing_support;

// Memory with an object somewhere in the middle; everything else must stay as it is.
class Memory {
 public:
  Memory() {
    std::mt19937 random(seed);
    for (auto& byte : before_) byte = static_cast<unsigned char>(random());
    std::copy(std::begin(before_), std::end(before_), std::begin(now_));
  }
  unsigned char* at(int offset) { return now_ + middle + offset; }
  const unsigned char* old(int offset) const { return before_ + middle + offset; }
  bool unchanged_but(int offset, std::size_t size) const {
    const int begin = middle + offset, end = begin + static_cast<int>(size);
    return std::equal(now_, now_ + begin, before_) && std::equal(now_ + end, std::end(now_), before_ + end);
  }

 private:
  static constexpr int middle = 512;
  alignas(64) unsigned char before_[1280];
  alignas(64) unsigned char now_[1280];
};

constexpr int offsets[] = {0, 1, 3, 64, -64, -37};

// A pointer as the core has it: any address, whatever the type says.
template <class M>
M* pointer_to(unsigned char* address) {
  return reinterpret_cast<M*>(reinterpret_cast<std::uintptr_t>(address));
}

template <class V, class M>
void drive_load(V (*f)(const M*, int)) {
  for (int misalignment = 0; misalignment < 8; ++misalignment)
    for (int offset : offsets) {
      Memory memory;
      const V v = f(pointer_to<const M>(memory.at(misalignment)), offset);
      ASSERT_EQ(std::memcmp(v._, memory.old(misalignment + offset), sizeof v._), 0) << misalignment << " " << offset;
      ASSERT_TRUE(memory.unchanged_but(0, 0));
    }
}

template <class V, class M>
void drive_load_IP(void (*f)(V&, const M**, int)) {
  for (int misalignment = 0; misalignment < 8; ++misalignment)
    for (int increment : offsets) {
      Memory memory;
      const M* pointer = pointer_to<const M>(memory.at(misalignment));
      V v;
      f(v, &pointer, increment);
      ASSERT_EQ(std::memcmp(v._, memory.old(misalignment), sizeof v._), 0);
      ASSERT_EQ(static_cast<const void*>(pointer), memory.at(misalignment + increment));
    }
}

template <class V, class M>
void drive_store(void (*f)(const V&, const M*, int)) {
  for (int misalignment = 0; misalignment < 8; ++misalignment)
    for (int offset : offsets) {
      Memory memory;
      const V v = filled<V>(0xA5);
      f(v, pointer_to<const M>(memory.at(misalignment)), offset);
      ASSERT_EQ(std::memcmp(v._, memory.at(misalignment + offset), sizeof v._), 0);
      ASSERT_TRUE(memory.unchanged_but(misalignment + offset, sizeof v._));
    }
}

template <class V, class M>
void drive_store_IP(void (*f)(const V&, M**, int)) {
  for (int misalignment = 0; misalignment < 8; ++misalignment)
    for (int increment : offsets) {
      Memory memory;
      const V v = filled<V>(0xA5);
      M* pointer = pointer_to<M>(memory.at(misalignment));
      f(v, &pointer, increment);
      ASSERT_EQ(std::memcmp(v._, memory.at(misalignment), sizeof v._), 0);
      ASSERT_TRUE(memory.unchanged_but(misalignment, sizeof v._));
      ASSERT_EQ(static_cast<const void*>(pointer), memory.at(misalignment + increment));
    }
}

template <class T>
void drive_move(T (*f)(const T&)) {
  T from;
  std::mt19937 random(seed);
  fill_random<layout_of<T>>(from._, random);
  EXPECT_TRUE(same_bits(f(from), from));
}

// Where a conversion finds its element: a host scalar's address is rounded down to its size.
template <class M>
int element_offset(int offset) {
  const int size = sizeof(M);
  return std::is_class_v<M> ? offset : offset - ((offset % size) + size) % size;
}

template <class Packed>
constexpr bool is_spill = std::is_same_v<Packed, packed1536>;

template <class Reg, class Mem>
void drive_mtor(const char* name, Reg (*f)(const Mem*, int)) {
  using R = layout_of<Reg>;
  using M = memory_layout<Mem>;
  for (int offset = -9; offset <= 9; ++offset) {
    Memory memory;
    const Reg got = f(pointer_to<const Mem>(memory.at(offset / 2)), offset - offset / 2);
    const unsigned char* element = memory.old(element_offset<Mem>(offset));
    Reg expected = filled<Reg>(0);
    for (int i = 0; i < R::count; ++i) {
      Int value = 0;
      if constexpr (is_spill<M>) {
        for (int b = 0; b < R::bits; ++b) {
          const int bit = i * R::bits + b;
          value |= Int{element[bit / 8] >> (bit % 8) & 1} << b;
        }
      } else {
        value = lane<M>(element, M::count == R::count ? i : 0);
      }
      if constexpr (!is_spill<R>) set_lane<R>(expected._, i, value);
    }
    ASSERT_TRUE(same_bits(got, expected)) << name << " at " << offset;
    ASSERT_TRUE(memory.unchanged_but(0, 0)) << name;
  }
}

// Lanes of 128 and 256 bits are no numbers; they are copied.
template <class Reg, class Mem>
void drive_whole_lane(void (*store)(const Reg&, const Mem*, int), Reg (*load)(const Mem*, int)) {
  Memory memory;
  if (load) {
    const Reg got = load(pointer_to<const Mem>(memory.at(3)), 2);
    EXPECT_EQ(std::memcmp(got._, memory.old(5), sizeof got._), 0);
  } else {
    const Reg value = filled<Reg>(0x3C);
    store(value, pointer_to<const Mem>(memory.at(3)), 2);
    EXPECT_EQ(std::memcmp(value._, memory.at(5), std::min(sizeof(Reg), sizeof(Mem))), 0);
    EXPECT_TRUE(memory.unchanged_but(5, sizeof(Mem)));
  }
}

// What a lane becomes in memory. Narrower signed memory saturates, but for the images of accumulators.
template <class R, class M>
Int stored_value(Int value) {
  constexpr bool image = R::count > 1 && R::count == M::count && (R::bits == 24 || R::bits == 48);
  if (image || M::bits >= R::bits || !std::is_signed_v<typename M::container>) return value;
  using Limits = std::numeric_limits<typename M::container>;
  return std::clamp<Int>(value, Limits::min(), Limits::max());
}

template <class Reg, class Mem>
void drive_rtom(const char* name, void (*f)(const Reg&, const Mem*, int)) {
  using R = layout_of<Reg>;
  using M = memory_layout<Mem>;
  std::mt19937 random(seed);
  for (Int corner : corners<R>()) {
    const int offset = static_cast<int>(random() % 19) - 9;
    Memory memory;
    Reg value;
    fill_random<R>(value._, random);
    set_lane<R>(value._, 0, corner);
    f(value, pointer_to<const Mem>(memory.at(offset / 2)), offset - offset / 2);
    const int element = element_offset<Mem>(offset);
    if constexpr (is_spill<M>) {
      for (int bit = 0; bit < 1536; ++bit)
        ASSERT_EQ(memory.at(element)[bit / 8] >> (bit % 8) & 1, lane<R>(value._, bit / R::bits) >> (bit % R::bits) & 1)
            << name;
    } else {
      for (int i = 0; i < M::count; ++i) {
        const Int expected = as_lane<M>(stored_value<R, M>(lane<R>(value._, i)));
        ASSERT_EQ(lane<M>(memory.at(element), i), expected) << name << " lane " << i << " = " << lane<R>(value._, i);
      }
    }
    ASSERT_TRUE(memory.unchanged_but(element, sizeof(Mem))) << name << " at " << offset;
  }
}

template <class T>
constexpr bool is_wide_lane = layout_of<T>::bits > 64;

}  // namespace

#define KASTARRI_TEST_SUITE "moves"
#define TEST_load_I(NAME, F, V, M, K) drive_load(F)
#define TEST_load_IP(NAME, F, V, M, K) drive_load_IP(F)
#define TEST_store_I(NAME, F, V, M, K) drive_store(F)
#define TEST_store_IP(NAME, F, V, M, K) drive_store_IP(F)
#define TEST_move(NAME, F, T) drive_move(F)
#define TEST_mtor(NAME, F, REG, MEM)        \
  if constexpr (is_wide_lane<REG>)          \
    drive_whole_lane<REG, MEM>(nullptr, F); \
  else                                      \
    drive_mtor(NAME, F)
#define TEST_rtom(NAME, F, REG, MEM)        \
  if constexpr (is_wide_lane<REG>)          \
    drive_whole_lane<REG, MEM>(F, nullptr); \
  else                                      \
    drive_rtom(NAME, F)
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
