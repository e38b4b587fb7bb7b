// The cascade in plain C++, single precision. The exact sum of a product of singles and a single is rounded once:
// it fits a double but for its last bits at most, which std::fma keeps.
#include <cmath>

#include "biquad/biquad.h"

void biquad_reference(const Section* sections, int section_count, const short* x, short* y, int frames) {
  float s1[MAX_SECTIONS] = {}, s2[MAX_SECTIONS] = {};
  for (int n = 0; n < frames; ++n) {
    float signal = static_cast<float>(x[n]) / 32768;
    for (int k = 0; k < section_count; ++k) {
      const Section& s = sections[k];
      const float out = std::fmaf(s.b0, signal, s1[k]);
      s1[k] = std::fmaf(-s.a1, out, std::fmaf(s.b1, signal, s2[k]));
      s2[k] = std::fmaf(-s.a2, out, s.b2 * signal);
      signal = out;
    }
    const float bounded = signal > 32767.0f / 32768 ? 32767.0f / 32768 : signal < -1 ? -1.0f : signal;
    y[n] = static_cast<short>(bounded * 32768);
  }
}
