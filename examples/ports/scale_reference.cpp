// The same in plain C++: what the kernel is checked against, bit for bit.
#include "ports/scale.h"

void scale_reference(const short* x, int gain, short* y, int count) {
  for (int n = 0; n < count; ++n) {
    const int rounded = (x[n] * gain + (1 << (GAIN_BITS - 1))) >> GAIN_BITS;
    y[n] = static_cast<short>(rounded > 32767 ? 32767 : rounded < -32768 ? -32768 : rounded);
  }
}
