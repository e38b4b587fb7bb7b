// The filter as a kernel for the core: 32 samples at a time, one multiply-accumulate a tap.
#include <kastarri.h>
#include <kastarri/names.h>

#include "fir/fir.h"

void fir(const short* x, const short* taps, int tap_count, short* y, int count) {
  // Every tap in all lanes, once for the whole sound. On the PC registers lie in memory, and are quickest
  // where they do not cross cache lines.
  alignas(64) qv_vecNx16 tap[FIR_MAX_TAPS];
  for (int k = 0; k < tap_count; ++k) ZRA_LSRNX16_IP(tap[k], &taps, sizeof(short));

  auto* out = reinterpret_cast<qv_vecNx16*>(y);
  for (int n = 0; n < count; n += 32) {
    // Loads take any address: the window moves by one sample from tap to tap.
    const auto* in = reinterpret_cast<const qv_vecNx16*>(x + n);
    alignas(64) qv_vecNx16 samples;
    ZRA_LVNX16_IP(samples, &in, sizeof(short));
    alignas(64) qv_vecNx48 sum = ZRA_MULNX16(samples, tap[0]);
    for (int k = 1; k < tap_count; ++k) {
      ZRA_LVNX16_IP(samples, &in, sizeof(short));
      ZRA_MULANX16(sum, samples, tap[k]);
    }
    // Products of Q15 numbers have 30 fractional bits: back to Q15, rounded and saturated.
    alignas(64) const qv_vecNx16 filtered = ZRA_PACKVRNX48(sum, 15);
    if (count - n >= 32) {
      ZRA_SVNX16_IP(filtered, &out, sizeof(qv_vecNx16));
    } else {
      // The last samples only: the store reads the whole register's room and leaves the rest of it as it is.
      vboolN rest;
      rest._[0] = (1u << (count - n)) - 1;
      ZRA_SVNX16T_I(filtered, out, 0, rest);
    }
  }
}
