// A module with the kernels of the examples or, PLAIN, with the loops that they are checked against.
#include "kernels.h"

extern "C" __attribute__((visibility("default"))) const Kernels kernels;
#ifdef PLAIN
const Kernels kernels = {fir_reference, convolve_reference, multiply_add_multiply};
#else
const Kernels kernels = {fir, convolve, multiply_add_multiply};
#endif
