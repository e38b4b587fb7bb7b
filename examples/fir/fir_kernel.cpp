// The filter as a kernel for the core: 32 samples at a time, two taps a multiply-accumulate.
#include <kastarri.h>
#include <kastarri/names.h>

#include "fir/fir.h"

void fir(const short* x, const short* taps, int tap_count, short* y, int count) {
  // Taps in pairs, the earlier one in the upper half of a word: taps 3, 5, 7 become 0x00030005, 0x00070000.
  qv_int32pr pair[(FIR_MAX_TAPS + 1) / 2];
  const int pairs = (tap_count + 1) / 2;
  for (int k = 0; k < pairs; ++k) {
    const int later = 2 * k + 1 < tap_count ? taps[2 * k + 1] : 0;
    pair[k]._[0] = static_cast<unsigned>(taps[2 * k]) << 16 | (static_cast<unsigned>(later) & 0xffff);
  }

  auto* out = reinterpret_cast<qv_vecNx16*>(y);
  for (int n = 0; n < count; n += 32) {
    // Tap k meets the samples from x[n + k] on: the next load begins one sample later, at whatever address that is.
    const auto* in = reinterpret_cast<const qv_vecNx16*>(x + n);
    // On the PC registers lie in memory. Aligned to 64 bytes, each is in one cache line, which is quickest.
    alignas(64) qv_vecNx16 earlier, later;
    ZRA_LVNX16_IP(earlier, &in, sizeof(short));
    ZRA_LVNX16_IP(later, &in, sizeof(short));
    alignas(64) qv_vecNx48 sum = ZRA_MULPN16XR16(earlier, later, pair[0]);
    for (int k = 1; k < pairs; ++k) {
      ZRA_LVNX16_IP(earlier, &in, sizeof(short));
      ZRA_LVNX16_IP(later, &in, sizeof(short));
      ZRA_MULPAN16XR16(sum, earlier, later, pair[k]);
    }
    // Products of Q15 numbers have 30 fractional bits: back to Q15, rounded and saturated.
    alignas(64) const qv_vecNx16 filtered = ZRA_PACKVRNX48(sum, 15);
    if (count - n >= 32) {
      ZRA_SVNX16_IP(filtered, &out, sizeof(qv_vecNx16));
    } else {
      // Fewer samples than lanes are left: lanes whose bit is 0 are not written.
      vboolN rest;
      rest._[0] = (1u << (count - n)) - 1;
      ZRA_SVNX16T_I(filtered, out, 0, rest);
    }
  }
}
