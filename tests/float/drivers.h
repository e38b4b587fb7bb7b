// Drivers of floating-point intrinsics. Every case runs in all rounding modes under a host that has its
// own ideas of its control words, and is compared with the model in bits and flags:
//   in one lane, the others zero, lane after lane: its own flags;
//   in a register full of cases: results of all lanes, the union of flags.
// In one lane a mode a case will do, taken in turn, where the mode makes no difference (bits, relations) or the same
// code has been through all of them (predicated forms).
#ifndef KASTARRI_TESTS_FLOAT_DRIVERS_H
#define KASTARRI_TESTS_FLOAT_DRIVERS_H

#include <functional>
#include <map>
#include <string>

#include "float/cases.h"
#include "float/model.h"
#include "kastarri/float.h"
#include "support/drivers.h"
#include "support/host_state.h"

namespace testing_support {

using Model_function = exact::Answer (*)(const exact::Format&, int mode, const Bits*);

template <class L>
constexpr const exact::Format& format = L::bits == 16 ? exact::half : exact::single;

struct FloatState {
  FloatState(int mode) {
    cstub_Km_ZNB_Orbis_R5_64k_proc.states.RoundMode = static_cast<unsigned>(mode);
    cstub_Km_ZNB_Orbis_R5_64k_proc.states.StickyFlags = 0;
  }
  ~FloatState() { cstub_Km_ZNB_Orbis_R5_64k_proc.states.RoundMode = 0; }
  unsigned flags() const { return cstub_Km_ZNB_Orbis_R5_64k_proc.states.StickyFlags; }
};

struct Register {
  alignas(64) unsigned char bytes[64];
};

// The modes in which a case runs in one lane.
enum class Alone { in_every_mode, in_one_mode };

// Operands L, result R; call(operand images, result image).
template <class L, class R>
class FloatCheck {
 public:
  using Call = std::function<void(const Register*, Register&)>;
  using Answers = std::vector<exact::Answer>;

  FloatCheck(std::string name, int operands, Call call, Alone alone = Alone::in_every_mode)
      : name_(std::move(name)), operands_(operands), call_(std::move(call)), alone_(alone) {}

  // The operation on floats that a model tells. Models are slow: each answer is found once and serves
  // all rows of the operation.
  void run(Model_function model) {
    static std::map<int, std::vector<Case>> known_cases;
    std::vector<Case>& all = known_cases[operands_];
    if (all.empty()) all = cases(format<L>, operands_);
    run(all, [&](int mode) -> const Answers& {
      static std::map<std::pair<Model_function, int>, Answers> known;
      Answers& answers = known[{model, mode}];
      if (answers.empty())
        for (const Case& x : all) answers.push_back(model(format<L>, mode, x.data()));
      return answers;
    });
  }

  void run(const std::vector<Case>& all, const std::function<const Answers&(int mode)>& answers) {
    for (int mode = 0; mode < 4; ++mode) {
      const Answers& expected = answers(mode);
      const bool every = alone_ == Alone::in_every_mode;
      for (std::size_t n = every ? 0 : static_cast<std::size_t>(mode); n < all.size(); n += every ? 1 : 4) {
        one_lane(mode, all[n], expected[n], static_cast<int>(n % L::count));
        if (testing::Test::HasFatalFailure()) return;
      }
      for (std::size_t n = 0; L::count > 1 && n + L::count <= all.size(); n += L::count) {
        full(mode, &all[n], &expected[n]);
        if (testing::Test::HasFatalFailure()) return;
      }
    }
  }

 private:
  void one_lane(int mode, const Case& x, const exact::Answer& expected, int at) {
    Register images[3] = {}, result = {};
    for (int k = 0; k < operands_; ++k) set_lane<L>(images[k].bytes, at, x[static_cast<std::size_t>(k)]);
    const unsigned flags = call(mode, images, result);
    if (lane<R>(result.bytes, at) == as_lane<R>(static_cast<Int>(expected.bits)) && flags == expected.flags) return;
    check_lane(mode, x, expected, result, at);
    ASSERT_EQ(flags, expected.flags) << describe(mode, x, at) << " flags";
  }

  void full(int mode, const Case* x, const exact::Answer* expected) {
    Register images[3] = {}, result = {};
    unsigned raised = 0;
    for (int i = 0; i < L::count; ++i) {
      for (int k = 0; k < operands_; ++k) set_lane<L>(images[k].bytes, i, x[i][static_cast<std::size_t>(k)]);
      raised |= expected[i].flags;
    }
    const unsigned flags = call(mode, images, result);
    for (int i = 0; i < L::count; ++i) check_lane(mode, x[i], expected[i], result, i);
    ASSERT_EQ(flags, raised) << describe(mode, x[0], 0) << " and the lanes after it: flags";
  }

  unsigned call(int mode, const Register* images, Register& result) {
    FloatState state(mode);
    HostState host(calls_++);
    call_(images, result);
    host.expect_unchanged(name_);
    return state.flags();
  }

  void check_lane(int mode, const Case& x, const exact::Answer& expected, const Register& result, int i) {
    const Int got = lane<R>(result.bytes, i);
    ASSERT_EQ(got, as_lane<R>(static_cast<Int>(expected.bits)))
        << std::hex << std::showbase << describe(mode, x, i) << " expected " << expected.bits << ", got "
        << static_cast<Bits>(got);
  }

  std::string describe(int mode, const Case& x, int i) const {
    std::ostringstream text;
    text << name_ << " [" << cstub_Km_ZNB_Orbis_R5_64k_target() << ", seed " << seed << ", mode " << mode << "] lane "
         << i << std::hex << ":";
    for (int k = 0; k < operands_; ++k) text << " 0x" << x[static_cast<std::size_t>(k)];
    return text.str();
  }

  std::string name_;
  int operands_;
  Call call_;
  Alone alone_;
  unsigned calls_ = 0;
};

template <class T>
void write_image(const T& value, Register& image) {
  std::memcpy(image.bytes, &value, sizeof value);
}

// --- Shapes ---------------------------------------------------------------------------------------------

// f(images) gives the result register of type R from operands of type A.
template <class A, class R, class F>
void check_float(const char* name, int operands, Model_function model, F f, Alone alone = Alone::in_every_mode) {
  const auto call = [f](const Register* images, Register& result) { write_image(f(images), result); };
  FloatCheck<layout_of<A>, layout_of<R>>(name, operands, call, alone).run(model);
}

template <class R, class A>
void drive_float_a_r(const char* name, Model_function model, R (*f)(const A&)) {
  check_float<A, R>(name, 1, model, [f](const Register* x) { return f(as_register<A>(x[0].bytes)); });
}
template <class R, class A>
void drive_float_ab_r(const char* name, Model_function model, R (*f)(const A&, const A&),
                      Alone alone = Alone::in_every_mode) {
  const auto call = [f](const Register* x) { return f(as_register<A>(x[0].bytes), as_register<A>(x[1].bytes)); };
  check_float<A, R>(name, 2, model, call, alone);
}
template <class B, class A>
void drive_float_relation(const char* name, Model_function model, B (*f)(const A&, const A&)) {
  drive_float_ab_r(name, model, f, Alone::in_one_mode);
}
// The destination takes part as the first operand.
template <class T>
void drive_float_ra(const char* name, Model_function model, void (*f)(T&, const T&)) {
  check_float<T, T>(name, 2, model, [f](const Register* x) {
    T r = as_register<T>(x[0].bytes);
    f(r, as_register<T>(x[1].bytes));
    return r;
  });
}
template <class T>
void drive_float_acc_ab(const char* name, Model_function model, void (*f)(T&, const T&, const T&)) {
  check_float<T, T>(name, 3, model, [f](const Register* x) {
    T r = as_register<T>(x[0].bytes);
    f(r, as_register<T>(x[1].bytes), as_register<T>(x[2].bytes));
    return r;
  });
}

// A conversion of values that are lanes of L to lanes of R: answer(mode, value).
template <class L, class R, class Answer, class Call>
void check_conversion(const std::string& name, const std::vector<Case>& values, Answer answer, Call call) {
  std::vector<exact::Answer> answers;
  FloatCheck<L, R>(name, 1, call).run(values, [&](int mode) -> const std::vector<exact::Answer>& {
    answers.clear();
    for (const Case& x : values) answers.push_back(answer(mode, as_lane<L>(static_cast<Int>(x[0]))));
    return answers;
  });
}

// Numbers of a float layout, every `step`th of all when there are that many; the corners of an integer's.
template <class L>
std::vector<Case> values_of(std::size_t step) {
  std::vector<Case> values;
  if constexpr (std::is_same_v<typename L::number, integer>) {
    for (Int v : corners<L>()) values.push_back({static_cast<Bits>(v), 0, 0});
    std::mt19937 random(seed);
    for (int i = 0; i < 500; ++i) values.push_back({static_cast<Bits>(random() >> random() % 32), 0, 0});
  } else {
    const std::vector<Case> all = cases(format<L>, 1);
    for (std::size_t i = 0; i < all.size(); i += L::bits == 16 ? step : 1) values.push_back(all[i]);
  }
  return values;
}

// The value of a lane of From as a lane of To, by way of the scale.
template <class From, class To>
exact::Answer converted(int mode, Int value, int scale) {
  constexpr bool from_integer = std::is_same_v<typename From::number, integer>;
  constexpr bool to_integer = std::is_same_v<typename To::number, integer>;
  if constexpr (from_integer)
    return model::from_integer(format<To>, mode, value, scale);
  else if constexpr (!to_integer)
    return model::convert(format<From>, format<To>, mode, static_cast<Bits>(value));
  else {
    using C = typename To::container;
    return model::to_integer(format<From>, static_cast<Bits>(value), scale, std::numeric_limits<C>::min(),
                             std::numeric_limits<C>::max());
  }
}

// With an immediate: a few scales, those beyond the integer's width (Bits) and negative ones masked.
template <class From, class To, class Call>
void check_scaled(const std::string& name, int width, Call call) {
  for (int scale : {0, 1, 7, 15, 16, 31, 35, -1}) {
    check_conversion<From, To>(
        name + " scale " + std::to_string(scale), values_of<From>(scale == 0 ? 1 : 37),
        [&](int mode, Int value) { return converted<From, To>(mode, value, ((scale % width) + width) % width); },
        [&](const Register* x, Register& r) { call(x[0].bytes, scale, r); });
    if (testing::Test::HasFatalFailure()) return;
  }
}

template <class R, class A>
void drive_float_scaled(const char* name, R (*f)(const A&, int)) {
  using From = layout_of<A>;
  using To = layout_of<R>;
  constexpr int width = std::is_same_v<typename From::number, integer> ? From::bits : To::bits;
  check_scaled<From, To>(name, width,
                         [f](const void* x, int scale, Register& r) { write_image(f(as_register<A>(x), scale), r); });
}

// Constants, of which MPFR knows the transcendental ones, in every lane; numbers beyond 15 and negative
// ones wrap.
inline void constant(int number, exact::Number& x) {
  constexpr double plain[] = {0, 1, 2, 0.5, 3, 4, 0.25, 10};
  switch (const int n = (number % 16 + 16) % 16) {
    case 8:
      mpfr_set_ui(x, 1, MPFR_RNDN), mpfr_div_ui(x, x, 10, MPFR_RNDN);
      break;
    case 9:
      mpfr_const_pi(x, MPFR_RNDN);
      break;
    case 10:
      mpfr_const_pi(x, MPFR_RNDN), mpfr_div_ui(x, x, 2, MPFR_RNDN);
      break;
    case 11:
      mpfr_const_pi(x, MPFR_RNDN), mpfr_ui_div(x, 1, x, MPFR_RNDN);
      break;
    case 12:
      mpfr_set_ui(x, 1, MPFR_RNDN), mpfr_exp(x, x, MPFR_RNDN);
      break;
    case 13:
      mpfr_const_log2(x, MPFR_RNDN);
      break;
    case 14:
      mpfr_const_log2(x, MPFR_RNDN), mpfr_ui_div(x, 1, x, MPFR_RNDN);
      break;
    case 15:
      mpfr_sqrt_ui(x, 2, MPFR_RNDN);
      break;
    default:
      mpfr_set_d(x, plain[n], MPFR_RNDN);
  }
}
template <class T>
void drive_float_const(const char* name, T (*f)(int)) {
  using L = layout_of<T>;
  for (int number : {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16, 1000, -1}) {
    FloatState state(number & 3);
    const T r = f(number);
    EXPECT_EQ(state.flags(), 0u) << name;
    exact::Number x;
    constant(number, x);
    for (int i = 0; i < L::count; ++i)
      EXPECT_EQ(static_cast<Bits>(lane<L>(r._, i)), exact::round(format<L>, x, MPFR_RNDN).bits)
          << name << ' ' << number;
  }
}

// Predicated forms. With every lane enabled, the model; then with random ones, results and flags of the
// enabled lanes alone, which are those of the plain operation on operands that are zero elsewhere.
template <class T, class P, class F>
void drive_float_T(const char* name, int operands, Model_function model, F f) {
  using L = layout_of<T>;
  const auto call = [f, operands](const Register* x, const P& p, T r) {
    const T a = as_register<T>(x[0].bytes), b = as_register<T>(x[1].bytes), c = as_register<T>(x[2].bytes);
    if (operands == 3) r = a;
    f(r, a, b, c, p);
    return r;
  };
  const P all = filled<P>(0xFF);
  const auto run = [=](const Register* x) { return call(x, all, filled<T>(0x5A)); };
  check_float<T, T>(name, operands, model, run, Alone::in_one_mode);
  if (testing::Test::HasFatalFailure()) return;

  const std::vector<Case> every = cases(format<L>, operands);
  std::mt19937 random(seed);
  for (int n = 0; n < 400; ++n) {
    const int mode = n % 4;
    Register images[3] = {};
    T old = filled<T>(0x5A);
    P p = filled<P>(n % 8 == 0 ? 0 : 0xFF);
    if (n % 8 > 1) fill_random<layout_of<P>>(p._, random);
    Bits expected[L::count];
    unsigned raised = 0;
    for (int i = 0; i < L::count; ++i) {
      const Case& x = every[random() % every.size()];
      for (int k = 0; k < operands; ++k) set_lane<L>(images[k].bytes, i, x[static_cast<std::size_t>(k)]);
      const bool enabled = lane<layout_of<P>>(p._, i) != 0;
      const exact::Answer answer = model(format<L>, mode, x.data());
      expected[i] = enabled ? answer.bits : operands == 3 ? x[0] : static_cast<Bits>(lane<L>(old._, i));
      if (enabled) raised |= answer.flags;
    }
    FloatState state(mode);
    const T r = call(images, p, old);
    for (int i = 0; i < L::count; ++i)
      ASSERT_EQ(static_cast<Bits>(lane<L>(r._, i)), expected[i]) << name << " predicated, round " << n << " lane " << i;
    ASSERT_EQ(state.flags(), raised) << name << " predicated, round " << n << ": flags";
  }
}

template <class T, class P>
void drive_float_a_r_T(const char* name, Model_function model, void (*f)(T&, const T&, const P&)) {
  drive_float_T<T, P>(name, 1, model, [f](T& r, const T& a, const T&, const T&, const P& p) { f(r, a, p); });
}
template <class T, class P>
void drive_float_ab_r_T(const char* name, Model_function model, void (*f)(T&, const T&, const T&, const P&)) {
  drive_float_T<T, P>(name, 2, model, [f](T& r, const T& a, const T& b, const T&, const P& p) { f(r, a, b, p); });
}
template <class T, class P>
void drive_float_acc_ab_T(const char* name, Model_function model, void (*f)(T&, const T&, const T&, const P&)) {
  drive_float_T<T, P>(name, 3, model, [f](T& r, const T&, const T& b, const T& c, const P& p) { f(r, b, c, p); });
}

}  // namespace testing_support

#endif
