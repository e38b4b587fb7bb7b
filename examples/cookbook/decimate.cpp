// Decimate: filter and keep every other sample, in one go.
#include <cstdio>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

// y[n] = (x[2n] + 2 x[2n + 1] + x[2n + 2]) / 4, rounded half up, for count n, a multiple of 16. All 32 lanes are
// computed, and the pack takes the even ones. Reads x[0] to x[2 count + 1].
void halved_rate(const short* x, short* y, int count) {
  const qv_vecNx16 one = 1, two = 2;
  qv_vecN_2x16* out = reinterpret_cast<qv_vecN_2x16*>(y);
  for (int n = 0; n < count; n += 16) {
    const qv_vecNx16* in = reinterpret_cast<const qv_vecNx16*>(x + 2 * n);
    qv_vecNx48 sum = ZRA_MULNX16(ZRA_LVNX16_I(in, 0), one);
    ZRA_MULANX16(sum, ZRA_LVNX16_I(in, 2), two);
    ZRA_MULANX16(sum, ZRA_LVNX16_I(in, 4), one);
    ZRA_SVN_2X16S_IP(ZRA_PACKVRNX48_0(sum, 2), &out, sizeof(qv_vecN_2x16));  // 16 lanes of 32 bits, as 16-bit numbers
  }
}

int main() {
  short x[66], y[32];
  for (int n = 0; n < 66; ++n) x[n] = static_cast<short>(n % 2 == 0 ? 10 * n : 10 * n + 4);
  halved_rate(x, y, 32);
  std::printf("%d %d %d ... %d\n", y[0], y[1], y[2], y[31]);
}
