#include "integer/drivers.h"

namespace testing_support {

// Every lane number, and numbers far outside, on random vectors.
template <class L, class T, class Call>
void drive_replicate(const std::string& name, Call call) {
  std::mt19937 random(seed);
  std::vector<int> numbers = {
      -1, -L::count, -L::count - 1, 1000003, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()};
  for (int i = 0; i <= 2 * L::count; ++i) numbers.push_back(i);
  for (int number : numbers) {
    T a;
    fill_random<L>(a._, random);
    Int expected[L::count];
    for (Int& v : expected) v = lane<L>(a._, static_cast<int>(modulo(number, L::count)));
    call(name + " of lane " + std::to_string(number), a, number, expected);
    if (testing::Test::HasFatalFailure()) return;
  }
}

template <class T>
void drive_a_i_r(const std::string& name, T (*f)(const T&, int)) {
  using L = layout_of<T>;
  drive_replicate<L, T>(name, [f](const std::string& text, const T& a, int number, const Int(&expected)[L::count]) {
    expect_lanes<L>(text, 0, expected, f(a, number), [](int) { return ""; });
  });
}

template <class T, class P>
void drive_a_i_r_T(const std::string& name, void (*f)(T&, const T&, int, const P&)) {
  using L = layout_of<T>;
  Destination<T, P> destination;
  int n = 0;
  drive_replicate<L, T>(name, [&](const std::string& text, const T& a, int number, Int(&expected)[L::count]) {
    T r = a;
    f(r, r, number, filled<P>(0xFF));
    expect_lanes<L>(text + " in place", n, expected, r, [](int) { return ""; });
    destination(n, expected);
    r = destination.old;
    f(r, a, number, destination.p);
    expect_lanes<L>(text, n++, expected, r, [](int) { return ""; });
  });
}

template <class R, class T>
void drive_a_i_lane(const std::string& name, R (*f)(const T&, int)) {
  drive_replicate<layout_of<T>, T>(name, [f](const std::string& text, const T& a, int number, const Int* expected) {
    expect_lanes<layout_of<R>>(text, 0, {expected[0]}, f(a, number), [](int) { return ""; });
  });
}

// Whatever stood where the value is made.
template <class T>
void drive_zero(T (*f)()) {
  alignas(T) unsigned char place[sizeof(T)];
  std::memset(place, 0xA5, sizeof place);
  const T* made = new (place) T(f());
  EXPECT_TRUE(same_bits(*made, filled<T>(0)));
}

}  // namespace testing_support

#define KERNEL_replicate(...)
#define KERNEL_selected(...)
#define KERNEL_filled(...)
#define TEST_a_i_r_T(NAME, F, T, P, K) testing_support::drive_a_i_r_T(NAME, F)
#undef TEST_a_i_r
#define TEST_a_i_r(NAME, F, T, K) testing_support::drive_a_i_r(NAME, F)
#define TEST_a_i_lane(NAME, F, R, T, K) testing_support::drive_a_i_lane(NAME, F)
#define TEST_value_r(NAME, F, T, K) testing_support::drive_zero(F)

#define KASTARRI_TEST_SUITE "replicate"
#include "support/drivers_begin.h"

#include "integer/replicate.def"

#include "support/drivers_end.h"
