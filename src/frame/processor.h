// Which targets the processor runs. The build says which ones there are, best first:
// KASTARRI_FOR_TARGETS(X, ...) in the generated build_targets.h is X(avx512, ...) X(avx2, ...) ...
#ifndef KASTARRI_FRAME_PROCESSOR_H
#define KASTARRI_FRAME_PROCESSOR_H

#include "build_targets.h"

namespace {

// Called while the library is being relocated: nothing here may call out of it.
[[maybe_unused]] bool runs_avx512() {
  __builtin_cpu_init();
  return __builtin_cpu_supports("avx512f") && __builtin_cpu_supports("avx512bw") &&
         __builtin_cpu_supports("avx512dq") && __builtin_cpu_supports("avx512vl");
}

[[maybe_unused]] bool runs_avx2() {
  __builtin_cpu_init();
  return __builtin_cpu_supports("avx2") && __builtin_cpu_supports("fma") && __builtin_cpu_supports("f16c");
}

[[maybe_unused]] bool runs_sse2() { return true; }

// A processor with AVX-512 to which a register that has just been stored across cache lines comes back sooner in two
// loads of 256 bits than in one of 512.
[[maybe_unused]] bool reloads_halves_sooner() {
  __builtin_cpu_init();
  return __builtin_cpu_is("amdfam19h");
}

}  // namespace

#endif
