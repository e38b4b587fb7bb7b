// Complex multiplication of 16-bit samples by a carrier, twice: for the core and in plain C++.
//
// y[n] = x[n] * w[n] for complex numbers of Q15 parts, real part first; each part is rounded half up and
// saturated to 16 bits. `count` numbers, a multiple of MIXER_BLOCK.
#ifndef KASTARRI_EXAMPLES_MIXER_H
#define KASTARRI_EXAMPLES_MIXER_H

constexpr int MIXER_BLOCK = 16;

void mix(const short* x, const short* w, short* y, int count);
void mix_reference(const short* x, const short* w, short* y, int count);

#endif
