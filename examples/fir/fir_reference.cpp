// The same filter in plain C++: what the kernel is checked against, bit for bit, and timed against.
#include "fir/fir.h"

void fir_reference(const short* x, const short* taps, int tap_count, short* y, int count) {
  for (int n = 0; n < count; ++n) {
    long long sum = 0;  // 512 products of 31 bits, for which the core's accumulators have 48
    for (int k = 0; k < tap_count; ++k) sum += x[n + k] * taps[k];
    const long long rounded = (sum + 0x4000) >> 15;
    y[n] = static_cast<short>(rounded > 32767 ? 32767 : rounded < -32768 ? -32768 : rounded);
  }
}
