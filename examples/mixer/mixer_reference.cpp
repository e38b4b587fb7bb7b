// The same in plain C++: what the kernel is checked against, bit for bit, and timed against.
#include "mixer/mixer.h"

static short q15(long long product) {
  const long long rounded = (product + 0x4000) >> 15;
  return static_cast<short>(rounded > 32767 ? 32767 : rounded < -32768 ? -32768 : rounded);
}

void mix_reference(const short* x, const short* w, short* y, int count) {
  for (int n = 0; n < 2 * count; n += 2) {
    const long long re = x[n], im = x[n + 1];
    y[n] = q15(re * w[n] - im * w[n + 1]);
    y[n + 1] = q15(im * w[n] + re * w[n + 1]);
  }
}
