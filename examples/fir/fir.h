// A finite impulse response filter on 16-bit samples with Q15 taps, twice: for the core and in plain C++.
//
// y[n] = the sum of taps[k] * x[n + k] over k, as Q15 rounded half up, saturated to 16 bits, for the n
// below count. Both use x[0] to x[count + taps - 2]. The kernel loads and stores whole registers: behind its
// samples x and y have FIR_MARGIN more. What x has there makes no difference, what y has there stays.
#ifndef KASTARRI_EXAMPLES_FIR_H
#define KASTARRI_EXAMPLES_FIR_H

constexpr int FIR_MAX_TAPS = 512;
constexpr int FIR_MARGIN = 32;

void fir(const short* x, const short* taps, int tap_count, short* y, int count);
void fir_reference(const short* x, const short* taps, int tap_count, short* y, int count);

#endif
