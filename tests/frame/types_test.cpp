// Sizes, layouts and kinds of the register types, as programs that were compiled against them rely on.
#include <gtest/gtest.h>

#include <type_traits>

#include "frame/entry.h"
#include "kastarri/integer.h"
#include "kastarri/multiply.h"

namespace {

template <class T, int Size, int Align>
constexpr bool plain = sizeof(T) == Size && alignof(T) == Align &&
                       sizeof(T{}._) == Size&& std::is_trivial_v<T>&& std::is_standard_layout_v<T>;

static_assert(plain<qv_vec2Nx8, 64, 4> && plain<qv_vec2Nx8U, 64, 4> && plain<qv_vecNx16, 64, 4>);
static_assert(plain<qv_vecNx16U, 64, 4> && plain<qv_vecN_2x32v, 64, 4> && plain<qv_vecN_2x32Uv, 64, 4>);
static_assert(plain<qv_vecN_4x64, 64, 4> && plain<qv_vecN_8x128, 64, 4> && plain<qv_vecN_16x256, 64, 4>);
static_assert(plain<qv_vecNxf16, 64, 4> && plain<qv_vecN_2xf32, 64, 4>);
static_assert(plain<qv_vecNx8, 32, 4> && plain<qv_vecNx8U, 32, 4> && plain<qv_vecN_2x16, 32, 4>);
static_assert(plain<qv_vecN_2x16U, 32, 4> && plain<qv_vecN_2xf16, 32, 4>);
static_assert(plain<qv_vec2Nx24, 256, 4> && plain<qv_vecNx48, 256, 4> && plain<qv_vecN_2x64w, 128, 4>);
static_assert(plain<qv_vec2Nx16w, 128, 4> && plain<qv_vec2Nx16Uw, 128, 4> && plain<qv_vecNx32, 128, 4>);
static_assert(plain<qv_vecNx32U, 128, 4> && plain<qv_wvecspill, 192, 4> && plain<valign, 64, 4> &&
              plain<qv_gsr, 64, 4>);
static_assert(plain<vboolN, 4, 4> && plain<vbool2N, 8, 4> && plain<vboolN_2, 2, 2> && plain<vbool1, 1, 1>);
static_assert(plain<rkbool, 1, 1> && plain<rkbool4, 1, 1> && plain<rkbool8, 1, 1>);
static_assert(plain<qv_int8, 1, 1> && plain<qv_int8U, 1, 1> && plain<qv_int16, 2, 2> && plain<qv_int16U, 2, 2>);
static_assert(plain<qv_f16, 2, 2> && plain<rkfloat, 4, 4> && plain<qv_int24, 4, 4> && plain<qv_int32v, 4, 4>);
static_assert(plain<qv_int32Uv, 4, 4> && plain<qv_int32pr, 4, 4> && plain<qv_int48, 8, 4> && plain<qv_int64, 8, 4>);
static_assert(plain<qv_int64pr, 8, 4> && plain<qv_int64w, 8, 4> && plain<qv_int128, 16, 4> && plain<qv_int256, 32, 4>);

// The lanes of a register's layout are the whole register.
template <class T, class L = layout_of<T>>
constexpr bool filled = std::is_same_v<typename L::number, predicate_bit>
                            ? 8 * sizeof(T) >= L::count
                            : sizeof(T) == L::count * sizeof(typename L::container);
#define TYPE(T, UNIT, UNITS, LAYOUT, MEANING) static_assert(filled<T>);
#include "frame/types.def"
#undef TYPE

static_assert(std::is_same_v<qv_vecNx16, qv_vecNx16_space::qv_vecNx16_>);
static_assert(std::is_same_v<immediate, int>);

#ifdef __i386__

// Calls f(a, b, c, d) with a stack pointer that is `offset` bytes below a multiple of 64. The callee may
// or may not pop its hidden result argument.
__attribute__((noinline)) void call_with_stack(void* f, const void* a, const void* b, const void* c, const void* d,
                                               unsigned offset) {
  const void* arguments[] = {a, b, c, d};
  asm volatile(
      "movl %%esp, %%ebx\n\t"
      "andl $-64, %%esp\n\t"
      "subl %[offset], %%esp\n\t"
      "pushl 12(%[arguments])\n\t"
      "pushl 8(%[arguments])\n\t"
      "pushl 4(%[arguments])\n\t"
      "pushl (%[arguments])\n\t"
      "call *%[f]\n\t"
      "movl %%ebx, %%esp"
      : [f] "+S"(f), [offset] "+c"(offset)
      : [arguments] "D"(arguments)
      : "eax", "ebx", "edx", "memory", "cc", "xmm0", "xmm1", "xmm2", "xmm3", "xmm4", "xmm5", "xmm6", "xmm7");
}

// Callers keep the stack aligned to 4 bytes and no more; registers lie at any multiple of 4 too.
TEST(frame, caller_stack_is_aligned_to_4_bytes_only) {
  const qv_vecNx16 a(5), b(7);
  const vboolN p = vbool1(1);
  for (unsigned offset = 0; offset < 64; offset += 4) {
    qv_vecNx16 sum(0);
    call_with_stack(reinterpret_cast<void*>(&KASTARRI_SYMBOL(rk_zra32_ZRA_ADDNX16T)), &sum, &a, &b, &p, offset);
    vboolN equal;
    call_with_stack(reinterpret_cast<void*>(&KASTARRI_SYMBOL(rk_zra32_ZRA_EQNX16)), &equal, &a, &sum, nullptr, offset);
    EXPECT_EQ(equal._[0], 0u);
    qv_vecNx48 product;
    call_with_stack(reinterpret_cast<void*>(&KASTARRI_SYMBOL(rk_zra32_ZRA_MULNX16)), &product, &a, &b, nullptr, offset);
    qv_vecNx16 packed;
    call_with_stack(reinterpret_cast<void*>(&KASTARRI_SYMBOL(rk_zra32_ZRA_PACKVRNX48)), &packed, &product, nullptr,
                    nullptr, offset);
    for (int i = 0; i < 16; ++i) {
      EXPECT_EQ(sum._[i], 0x000C000Cu);
      EXPECT_EQ(packed._[i], 0x00230023u);
    }
  }
}

#endif

}  // namespace
