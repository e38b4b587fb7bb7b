// The kernels that are timed, as a module for the dynamic linker has them under the name `kernels`.
#ifndef KASTARRI_BENCH_STATIC_KERNELS_H
#define KASTARRI_BENCH_STATIC_KERNELS_H

#include "convolve/convolve.h"
#include "fir/fir.h"
#include "floats.h"

struct Kernels {
  decltype(&::fir) fir;
  decltype(&::convolve) convolve;
  decltype(&::multiply_add_multiply) multiply_add_multiply;
};

#endif
