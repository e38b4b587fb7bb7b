// Loads and stores of singles that are halves in memory, by their rows: what they access as all loads and stores do,
// the numbers and flags as all conversions do.
#include "float/drivers.h"
#include "memory/drivers.h"

namespace model {

using testing_support::Int;

constexpr auto WIDENED = [](Int half) { return convert(exact::half, exact::single, 0, static_cast<Bits>(half)).bits; };
constexpr auto ROUNDED = [](Int single) {
  return convert(exact::single, exact::half, 0, static_cast<Bits>(single)).bits;
};

}  // namespace model

namespace testing_support {

// An access in any mode, at an address.
template <class V, class M, class... P>
V load_from(const void* at, V (*f)(const M*, int, const P&...), const P&... p) {
  return f(static_cast<const M*>(at), 0, p...);
}
template <class V, class M, class... P>
V load_from(const void* at, void (*f)(V&, const M**, int, const P&...), const P&... p) {
  V r;
  const auto* pointer = static_cast<const M*>(at);
  f(r, &pointer, 0, p...);
  return r;
}
template <class V, class M, class... P>
void store_to(void* at, void (*f)(const V&, const M*, int, const P&...), const V& v, const P&... p) {
  f(v, static_cast<const M*>(at), 0, p...);
}
template <class V, class M, class... P>
void store_to(void* at, void (*f)(const V&, M**, int, const P&...), const V& v, const P&... p) {
  auto* pointer = static_cast<M*>(at);
  f(v, &pointer, 0, p...);
}

// The predicate of the lanes that are not +0. The others get what would raise flags: as they are not enabled, they are
// loaded as +0, leave the +0 in memory where it is, and raise none.
template <class P, class L>
P enabled_lanes(void* image) {
  constexpr Bits singles[] = {0x7F800001, 0x7F7FFFFF, 0x00000001};  // invalid; overflow; underflow
  P p = filled<P>(0);
  for (int i = 0; i < L::count; ++i) {
    const bool enabled = lane<L>(image, i) != 0;
    set_lane<layout_of<P>>(p._, i, enabled);
    if (!enabled) set_lane<L>(image, i, L::bits == 16 ? 0x7C01 : singles[i % 3]);
  }
  return p;
}

// Values among which there are zeros, one after every other on average.
inline std::vector<Case> with_zeros(const std::vector<Case>& values) {
  std::mt19937 random(seed);
  std::vector<Case> all;
  for (const Case& x : values) {
    all.push_back(x);
    if (random() & 1) all.push_back({0, 0, 0});
  }
  return all;
}

// Singles about halves and about the ties between two of them, the smaller ones more closely; about the ties at which
// halves begin, become normal and end, and where the result stops being tiny; the edges of singles; random ones.
inline const std::vector<Case>& singles() {
  static const std::vector<Case> all = [] {
    std::vector<Bits> values = edges(exact::single);
    std::mt19937 random(seed);
    for (Bits half = 1; half < 0x7BFF; half += 1 + half / 256) {
      const Bits exactly = static_cast<Bits>(model::WIDENED(half)), next = static_cast<Bits>(model::WIDENED(half + 1));
      const Bits tie = exactly + (next - exactly) / 2, sign = random() & 1 ? 0x80000000 : 0;
      for (Bits x : {exactly - 1, exactly, exactly + 1, tie - 1, tie, tie + 1}) values.push_back(x | sign);
    }
    for (Bits tie : {0x33000000u, 0x387FF000u, 0x387FF800u, 0x477FF000u})
      for (Bits x : {tie - 1, tie, tie + 1})
        for (Bits sign : {0u, 0x80000000u}) values.push_back(x | sign);
    for (int i = 0; i < 1000; ++i) values.push_back(static_cast<Bits>(random()));
    std::vector<Case> cases;
    for (Bits x : values) cases.push_back({x, 0, 0});
    return with_zeros(cases);
  }();
  return all;
}

// The numbers and flags of a load, of a store, f; the forms under a predicate have one of type P.
template <class... P, class F>
void check_widening(const std::string& name, F f) {
  const auto answer = [](int mode, Int half) { return converted<f16x16, f32x16>(mode, half, 0); };
  check_conversion<f16x16, f32x16>(name, with_zeros(values_of<f16x1>(1)), answer, [f](const Register* x, Register& r) {
    Register memory = x[0];
    write_image(load_from(memory.bytes, f, enabled_lanes<P, f16x16>(memory.bytes)...), r);
  });
}
template <class... P, class F>
void check_rounding(const std::string& name, F f) {
  const auto answer = [](int mode, Int single) { return converted<f32x16, f16x16>(mode, single, 0); };
  check_conversion<f32x16, f16x16>(name, singles(), answer, [f](const Register* x, Register& memory) {
    auto v = as_register<qv_vecN_2xf32>(x[0].bytes);
    store_to(memory.bytes, f, v, enabled_lanes<P, f32x16>(v._)...);
  });
}

}  // namespace testing_support

// By this name it goes first, while a child process that a store ends is still small.
#define KASTARRI_TEST_SUITE "float_memoryDeathTest"
#include "support/drivers_begin.h"

#define KERNEL_load_halves(OP, HALVES) \
  constexpr auto model_##OP = testing_support::memory_model<f32x16, HALVES>(model::WIDENED);
#define KERNEL_store_halves(OP, SINGLES, HALVES) \
  constexpr auto model_##OP = testing_support::memory_model<HALVES, SINGLES>(model::ROUNDED);
#define KERNEL_store_halves_where KERNEL_store_halves

#define TEST_load_I(NAME, F, V, M, K)                \
  testing_support::drive_load_I(NAME, model_##K, F); \
  testing_support::check_widening(NAME, F)
#define TEST_load_IP(NAME, F, V, M, K)                \
  testing_support::drive_load_IP(NAME, model_##K, F); \
  testing_support::check_widening(NAME, F)
#define TEST_load_I_T(NAME, F, V, M, P, K)           \
  testing_support::drive_load_I(NAME, model_##K, F); \
  testing_support::check_widening<P>(NAME, F)
#define TEST_load_IP_T(NAME, F, V, M, P, K)           \
  testing_support::drive_load_IP(NAME, model_##K, F); \
  testing_support::check_widening<P>(NAME, F)
#define TEST_store_I(NAME, F, V, M, K)                \
  testing_support::drive_store_I(NAME, model_##K, F); \
  testing_support::check_rounding(NAME, F)
#define TEST_store_IP(NAME, F, V, M, K)                \
  testing_support::drive_store_IP(NAME, model_##K, F); \
  testing_support::check_rounding(NAME, F)
#define TEST_store_I_T(NAME, F, V, M, P, K)           \
  testing_support::drive_store_I(NAME, model_##K, F); \
  testing_support::check_rounding<P>(NAME, F)
#define TEST_store_IP_T(NAME, F, V, M, P, K)           \
  testing_support::drive_store_IP(NAME, model_##K, F); \
  testing_support::check_rounding<P>(NAME, F)

#include "float/memory.def"

#include "support/drivers_end.h"
