#include <algorithm>

#include "integer/drivers.h"

namespace model {

using testing_support::Int;

template <int w>
constexpr Int highest = (Int{1} << (w - 1)) - 1;
template <int w>
constexpr Int clamped(Int v) {
  return std::clamp(v, -highest<w> - 1, highest<w>);
}

template <int w>
constexpr auto ADD = [](Int a, Int b) { return a + b; };
template <int w>
constexpr auto SUB = [](Int a, Int b) { return a - b; };
template <int w>
constexpr auto NEG = [](Int a) { return -a; };
template <int w>
constexpr auto ADDS = [](Int a, Int b) { return clamped<w>(a + b); };
template <int w>
constexpr auto SUBS = [](Int a, Int b) { return clamped<w>(a - b); };
template <int w>
constexpr auto NEGS = [](Int a) { return clamped<w>(-a); };
template <int w>
constexpr auto ABS = [](Int a) { return std::max(a, -a); };
template <int w>
constexpr auto ABSS = [](Int a) { return clamped<w>(std::max(a, -a)); };
template <int w>
constexpr auto ABSSUB = [](Int a, Int b) { return std::max(a - b, b - a); };
template <int w>
constexpr auto ABSSSUB = [](Int a, Int b) { return clamped<w>(std::max(a - b, b - a)); };

}  // namespace model

namespace testing_support {

// The result apart and in the operand's place; the predicate says which operands are negative.
template <class Model, class P, class T>
void drive_a_pr(const std::string& name, const Model& model, void (*f)(P&, T&, const T&)) {
  check(name, model, [f](const auto* images) {
    T r = as_register<T>(images[0].bytes), apart;
    P p = filled<P>(0x5A), p_apart = filled<P>(0xA5);
    const T a = r;
    f(p_apart, apart, a);
    f(p, r, r);
    for (int i = 0; i < layout_of<T>::count; ++i)
      EXPECT_EQ(lane<layout_of<P>>(p._, i), lane<layout_of<T>>(a._, i) < 0) << "lane " << i;
    EXPECT_TRUE(same_bits(p, p_apart) && same_bits(r, apart)) << "in place";
    return r;
  });
}

}  // namespace testing_support

#define KERNEL_unary_and_signs KERNEL_unary
#define TEST_a_pr(NAME, F, P, T, K) testing_support::drive_a_pr(NAME, model_##K, F)

#define KASTARRI_TEST_SUITE "arithmetic"
#include "support/drivers_begin.h"

#include "integer/arithmetic.def"

#include "support/drivers_end.h"
