// SAR and the shifts: every row against a model that multiplies and divides by powers of two, from every SAR.
#include <utility>

#include "scalar/drivers.h"

namespace model {

using testing_support::Int, testing_support::TWO32;

// A model takes SAR, which it may change, and the operands as exact numbers; the result counts modulo the size of what
// receives it.
constexpr Int modulo(Int s, Int n) { return (s % n + n) % n; }
constexpr Int times_power(Int v, Int n) { return modulo(v, TWO32) * (Int{1} << n); }

// The low 32 bits of hi * 2^32 + lo over 2^right.
constexpr Int funnel(Int hi, Int lo, Int right) {
  const auto bits = static_cast<std::uint64_t>(hi) * static_cast<std::uint64_t>(TWO32) + static_cast<std::uint64_t>(lo);
  return static_cast<Int>(bits / (std::uint64_t{1} << right) % static_cast<std::uint64_t>(TWO32));
}
constexpr Int funnel_signed(Int v, Int right) { return funnel(v < 0 ? TWO32 - 1 : 0, modulo(v, TWO32), right); }

constexpr auto rk_core_SSR = [](Int& sar, Int s) { sar = modulo(s, 32); };
constexpr auto rk_core_SSAI = rk_core_SSR;
constexpr auto rk_core_SSL = [](Int& sar, Int s) { sar = 32 - modulo(s, 32); };
constexpr auto rk_core_SSA8L = [](Int& sar, Int s) { sar = modulo(s, 4) * 8; };
constexpr auto rk_core_SSA8B = [](Int& sar, Int s) { sar = 32 - modulo(s, 4) * 8; };

constexpr auto rk_core_RSR_SAR = [](Int& sar) { return sar; };
constexpr auto rk_core_WSR_SAR = [](Int& sar, Int v) { sar = v % 64; };
constexpr auto rk_core_XSR_SAR = [](Int& sar, Int r) { return std::exchange(sar, r % 64); };

constexpr auto rk_core_SRC = [](Int& sar, Int a, Int b) { return funnel(a, b, sar); };
constexpr auto rk_core_SLL = [](Int& sar, Int v) { return funnel(v, 0, sar); };
constexpr auto rk_core_SRA = [](Int& sar, Int v) { return funnel_signed(v, sar); };
constexpr auto rk_core_SRL = [](Int& sar, Int v) { return funnel(0, v, sar); };

constexpr auto rk_core_SSAI_SRC = [](Int& sar, Int a, Int b, Int s) { return funnel(a, b, sar = modulo(s, 32)); };
constexpr auto rk_core_SSR_SRC = rk_core_SSAI_SRC;
constexpr auto rk_core_SSR_SRA = [](Int& sar, Int v, Int s) { return funnel_signed(v, sar = modulo(s, 32)); };
constexpr auto rk_core_SSR_SRL = [](Int& sar, Int v, Int s) { return funnel(0, v, sar = modulo(s, 32)); };
constexpr auto rk_core_SSL_SLL = [](Int& sar, Int v, Int s) {
  sar = 32 - modulo(s, 32);
  return times_power(v, modulo(s, 32));
};

// By 0 it gives 0, as the funnel shift that it is.
constexpr auto rk_core_SLLI = [](Int&, Int v, Int s) { return funnel(v, 0, modulo(-s, 32)); };
constexpr auto rk_core_SRAI = [](Int&, Int v, Int s) { return funnel_signed(v, modulo(s, 32)); };
constexpr auto rk_core_SRLI = [](Int&, Int v, Int s) { return funnel(0, v, modulo(s, 32)); };

}  // namespace model

namespace {

using namespace testing_support;

unsigned& SAR = cstub_Km_ZNB_Orbis_R5_64k_proc.states.SAR;

// Calls check(SAR, operands ...) for all values of the operands and every SAR, of three operands one SAR after the
// other.
template <class... A, class Check>
void for_states(const Check& check) {
  Int next = 0;
  for_values<A...>([&](auto... a) {
    const Int first = sizeof...(A) < 3 ? 0 : next++ % 64, end = sizeof...(A) < 3 ? 64 : first + 1;
    for (Int sar = first; sar < end; ++sar) {
      SAR = static_cast<unsigned>(sar);
      check(sar, a...);
    }
  });
}

template <class R, class... A, class Model>
void drive(const char* name, R (*f)(A...), Model model) {
  for_states<A...>([=](Int sar, auto... a) {
    const Int before = sar;
    if constexpr (std::is_void_v<R>) {
      f(operand<A>(a)...);
      model(sar, a...);
    } else {
      ASSERT_EQ(f(operand<A>(a)...), operand<R>(model(sar, a...))) << name << list(a...) << " with SAR " << before;
    }
    ASSERT_EQ(Int{SAR}, sar) << name << list(a...) << " leaves SAR, which was " << before;
  });
}

// The result is the new value of the operand.
template <class T, class Model>
void drive(const char* name, void (*f)(T&), Model model) {
  for_states<T>([=](Int sar, Int a) {
    const Int before = sar;
    T r = operand<T>(a);
    f(r);
    ASSERT_EQ(r, operand<T>(model(sar, a))) << name << list(a) << " with SAR " << before;
    ASSERT_EQ(Int{SAR}, sar) << name << list(a) << " leaves SAR, which was " << before;
  });
}

#define ENTRY(SYMBOL, SHAPE, ...) \
  const int tested_##SYMBOL =     \
      add_test("Funnel", #SYMBOL, [] { drive(#SYMBOL, &KASTARRI_SYMBOL(SYMBOL), model::SYMBOL); });

#include "frame/rows.h"

#include "scalar/funnel.def"

#include "frame/rows_end.h"

}  // namespace
