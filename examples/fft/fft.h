// The Fourier transform of 1,024 complex numbers of 16 bits, twice: for the core and in plain C++.
//
// y[k] * 2^exponent = the sum of x[n] * e^(-2 pi i k n / 1024) over n, but for rounding; the exponent is returned.
// Numbers are 16-bit parts, real part first. `turns` has e^(-2 pi i k / 1024) for k from 0 to 511, with TURN_BITS
// behind the point: 1 is 16384, which 16 bits hold.
//
// Ten stages make sums and differences of pairs of numbers, a and b, where b is turned before: a + w b and a - w b. All
// numbers of a block share their exponent, and each stage begins with the shift that block_shift tells: a is shifted
// (rounded down), w b is shifted as it leaves its wide product (rounded half up), and the sums do not overflow.
#ifndef KASTARRI_EXAMPLES_FFT_H
#define KASTARRI_EXAMPLES_FFT_H

constexpr int FFT_BITS = 10;
constexpr int FFT_SIZE = 1 << FFT_BITS;
constexpr int TURN_BITS = 14;

int fft(const short* x, const short* turns, short* y);
int fft_reference(const short* x, const short* turns, short* y);

// No part that a stage starts from may be larger. Turned, a number with both parts P has up to sqrt(2) P in one part,
// and P + sqrt(2) P must stay below 32768, with room for what rounding adds.
constexpr int LARGEST_PART = 13500;

// How far all parts are to be shifted right, to the left when it is negative, for the largest of them to come as close
// to LARGEST_PART as it may: 30000 by 2 to 7500, 100 by -7 to 12800.
inline int block_shift(int peak) {
  int shift = 0;
  if (peak == 0) return shift;
  while (peak >> shift > LARGEST_PART) ++shift;
  while (shift <= 0 && peak << (1 - shift) <= LARGEST_PART) --shift;
  return shift;
}

#endif
