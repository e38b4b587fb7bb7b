// The kernels that are timed, as a module for the dynamic linker has them under the name `kernels`.
#ifndef KASTARRI_BENCH_KERNELS_H
#define KASTARRI_BENCH_KERNELS_H

#include "convolve/convolve.h"
#include "fir/fir.h"
#include "floats.h"
#include "histogram/histogram.h"

constexpr int CHAIN_TAPS = 16;
// Room for the registers of chain_at, from any offset below 64 on.
constexpr int CHAIN_FRAME = 4096;

struct Kernels {
  decltype(&::fir) fir;
  decltype(&::convolve) convolve;
  decltype(&::fir) chain;  // the filter with a multiply-accumulate a tap, written without a thought of speed
  void (*chain_at)(const short* x, const short* taps, short* y, int count, void* frame);  // its registers there
  decltype(&::multiply_add_multiply) multiply_add_multiply;
  decltype(&::count_greys) count_greys;
  decltype(&::look_up) look_up;
};

#endif
