// A host program with its own floating-point state, and whether the library leaves it alone.
#ifndef KASTARRI_TESTS_HOST_STATE_H
#define KASTARRI_TESTS_HOST_STATE_H

#include <gtest/gtest.h>

#include <cstdint>
#include <string>

namespace testing_support {

// Sets state number n (modulo their count) of the SSE and x87 units until destroyed.
class HostState {
 public:
  explicit HostState(unsigned n) {
    asm volatile("stmxcsr %0" : "=m"(mxcsr_before_));
    asm volatile("fnstcw %0" : "=m"(control_before_));
    const std::uint32_t mxcsr = states[n % count].mxcsr;
    const std::uint16_t control = states[n % count].control;
    asm volatile("fninit\n\tfldcw %1\n\tldmxcsr %0" : : "m"(mxcsr), "m"(control) : "memory");
    read(set_);
  }
  ~HostState() {
    asm volatile("fninit\n\tfldcw %1\n\tldmxcsr %0" : : "m"(mxcsr_before_), "m"(control_before_) : "memory");
  }

  void expect_unchanged(const std::string& name) const {
    State now;
    read(now);
    asm volatile("ldmxcsr %0" : : "m"(mxcsr_before_) : "memory");
    ASSERT_EQ(now.mxcsr, set_.mxcsr) << name << ": MXCSR";
    ASSERT_EQ(now.control, set_.control) << name << ": x87 control word";
    ASSERT_EQ(now.status, set_.status) << name << ": x87 status word";
  }

 private:
  struct State {
    std::uint32_t mxcsr;
    std::uint16_t control, status;
  };
  static void read(State& state) {
    asm volatile("stmxcsr %0" : "=m"(state.mxcsr) : : "memory");
    asm volatile("fnstcw %0" : "=m"(state.control) : : "memory");
    asm volatile("fnstsw %0" : "=m"(state.status) : : "memory");
  }

  // As a program starts, and once it has rounded; flush-to-zero and denormals-are-zero, as fast-math sets them; each
  // other rounding mode, with flags raised, and singles on the x87 unit; all exceptions unmasked, so that any that
  // escapes ends the test.
  static constexpr State states[] = {{0x1F80, 0x037F, 0}, {0x9FC0, 0x037F, 0}, {0x3FA1, 0x047F, 0}, {0x1FA0, 0x037F, 0},
                                     {0x5FBF, 0x087F, 0}, {0xFFC8, 0x0C7F, 0}, {0x0000, 0x0340, 0}};
  static constexpr unsigned count = sizeof states / sizeof *states;

  std::uint32_t mxcsr_before_;
  std::uint16_t control_before_;
  State set_;
};

}  // namespace testing_support

#endif
