// The mixer as a kernel for the core: 16 complex numbers at a time.
#include <kastarri.h>
#include <kastarri/names.h>

#include "mixer/mixer.h"

void mix(const short* x, const short* w, short* y, int count) {
  const auto* samples = reinterpret_cast<const qv_vecNx16*>(x);
  const auto* carrier = reinterpret_cast<const qv_vecNx16*>(w);
  auto* out = reinterpret_cast<qv_vecNx16*>(y);
  for (int n = 0; n < count; n += MIXER_BLOCK) {
    alignas(64) qv_vecNx16 a, b;
    ZRA_LVNX16_IP(a, &samples, sizeof a);
    ZRA_LVNX16_IP(b, &carrier, sizeof b);
    alignas(64) const qv_vecNx48 product = ZRA_MULNX16C(a, b);
    // Products of Q15 numbers have 30 fractional bits: back to Q15, rounded and saturated.
    ZRA_SVNX16_IP(ZRA_PACKVRNX48(product, 15), &out, sizeof a);
  }
}
