// The host's floating-point control word (MXCSR) while its unit computes.
#ifndef KASTARRI_FLOAT_HOST_FPU_H
#define KASTARRI_FLOAT_HOST_FPU_H

#include "float/formats.h"

namespace {

// What the pointer leads to is unknown before.
template <class Pointer>
inline void pin_operand(Pointer& pointer) {
  asm volatile("" : "+r"(pointer) : : "memory");
}
// The register is computed before, and what is computed of it is not computed of its operands again.
template <class V>
inline V pinned(V result) {
  asm volatile("" : "+x"(result));
  return result;
}

inline word read_control_word() {
  word mxcsr;
  asm volatile("stmxcsr %0" : "=m"(mxcsr) : : "memory");
  return mxcsr;
}
inline void write_control_word(word mxcsr) { asm volatile("ldmxcsr %0" : : "m"(mxcsr) : "memory"); }

// While it lives, subnormals are honoured, every exception is masked, and sums of 0 are +0. Afterwards MXCSR is as
// it was before. It is written only where it differs.
// Compilers know nothing of MXCSR and move arithmetic past its writes; they cannot where operands are read through
// pointers, and what arithmetic yields passes through registers, that are outputs of assembler statements between the
// writes: what a load yields is unknown before the one write, and what is computed is known before the other.
class HostFpu {
 public:
  template <class... Pointers>
  [[gnu::always_inline]] explicit HostFpu(Pointers&... operands) : found_(read_control_word()) {
    if (__builtin_expect((found_ & ~flags) != all_masked, 0)) write_control_word(all_masked);
    (pin_operand(operands), ...);
  }
  [[gnu::always_inline]] ~HostFpu() {
    if (__builtin_expect(read_control_word() != found_, 0)) write_control_word(found_);
  }
  HostFpu(const HostFpu&) = delete;
  HostFpu& operator=(const HostFpu&) = delete;

 private:
  static constexpr word all_masked = 0x1F80, flags = 0x3F;

  const word found_;
};

}  // namespace

#endif
