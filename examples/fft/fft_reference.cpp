// The transform in plain C++, in the order of the textbook: what the kernel is checked against, bit for bit, and timed
// against.
#include <algorithm>
#include <cstdlib>

#include "fft/fft.h"

static short saturated(int value) {
  return static_cast<short>(value > 32767 ? 32767 : value < -32768 ? -32768 : value);
}

static int scaled(int value, int shift) { return shift < 0 ? value * (1 << -shift) : value >> shift; }

// A product without `bits` of its low bits, rounded half up.
static int without(int product, int bits) { return (product + (1 << (bits - 1))) >> bits; }

// The size of the largest part. That of -32768 is 32767, as a saturating core has it.
static int peak_of(const short* x) {
  int peak = 0;
  for (int i = 0; i < 2 * FFT_SIZE; ++i) peak = std::max(peak, std::abs(static_cast<int>(x[i])));
  return std::min(peak, 32767);
}

// The numbers to the places whose bits are those of their own reversed: number 3, 0000000011, to place 1100000000.
static void reorder(const short* x, short* y) {
  for (int n = 0; n < FFT_SIZE; ++n) {
    int place = 0;
    for (int bit = 0; bit < FFT_BITS; ++bit) place |= (n >> bit & 1) << (FFT_BITS - 1 - bit);
    y[2 * place] = x[2 * n];
    y[2 * place + 1] = x[2 * n + 1];
  }
}

int fft_reference(const short* x, const short* turns, short* y) {
  reorder(x, y);
  int exponent = 0;
  for (int span = 1; span < FFT_SIZE; span *= 2) {
    const int shift = block_shift(peak_of(y));
    exponent += shift;
    for (int start = 0; start < FFT_SIZE; start += 2 * span) {
      for (int k = 0; k < span; ++k) {
        short* const a = y + 2 * (start + k);
        short* const b = a + 2 * span;
        const short* const w = turns + 2 * (k * (FFT_SIZE / 2 / span));
        const int re = without(b[0] * w[0] - b[1] * w[1], TURN_BITS + shift);
        const int im = without(b[1] * w[0] + b[0] * w[1], TURN_BITS + shift);
        const int a_re = scaled(a[0], shift), a_im = scaled(a[1], shift);
        a[0] = saturated(a_re + re), a[1] = saturated(a_im + im);
        b[0] = saturated(a_re - re), b[1] = saturated(a_im - im);
      }
    }
  }
  return exponent;
}
