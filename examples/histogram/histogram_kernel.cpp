// The histogram and the look-up as kernels for the core, 32 pixels at a time.
#include <kastarri.h>
#include <kastarri/names.h>

#include <algorithm>

#include "histogram/histogram.h"

namespace {

constexpr int LANES = 32;
// So many pixels a 16-bit counter can count even when all are of one grey, in whole registers.
constexpr int FULL = 65535 / LANES * LANES;

vboolN first_lanes(int n) {
  vboolN p;
  p._[0] = (1u << n) - 1;
  return p;
}

// Adds 16-bit counts to 32-bit ones, 16 at a time.
void add_counts(const unsigned short* part, unsigned* counts) {
  auto* in = reinterpret_cast<const qv_vecN_2x16U*>(part);
  auto* sums = reinterpret_cast<qv_vecN_2x32Uv*>(counts);
  for (int g = 0; g < GREYS; g += LANES / 2) {
    alignas(64) qv_vecN_2x32Uv more;
    ZRA_LVN_2X16U_IP(more, &in, sizeof(qv_vecN_2x16U));
    alignas(64) const qv_vecN_2x32Uv sum = ZRA_ADDN_2X32U(ZRA_LVN_2X32U_I(sums, 0), more);
    ZRA_SVN_2X32U_IP(sum, &sums, sizeof sum);
  }
}

}  // namespace

void count_greys(const unsigned char* pixels, int count, unsigned* counts) {
  std::fill_n(counts, GREYS, 0u);
  const auto* in = reinterpret_cast<const qv_vecNx8U*>(pixels);
  for (int done = 0; done < count; done += FULL) {
    alignas(64) unsigned short part[GREYS] = {};
    const int end = std::min(count - done, FULL);
    for (int i = 0; i < end; i += LANES) {
      alignas(64) qv_vecNx16U greys;
      if (end - i >= LANES) {
        ZRA_LVNX8U_IP(greys, &in, sizeof(qv_vecNx8U));
      } else {
        // Lanes without a pixel load 0, and the scatter will count them as black: they are taken off beforehand.
        ZRA_LVNX8UT_IP(greys, &in, sizeof(qv_vecNx8U), first_lanes(end - i));
        part[0] = static_cast<unsigned short>(part[0] - (LANES - (end - i)));
      }
      // Offsets are in bytes, and a counter has two: twice the grey. Lanes of the same grey count one after the other.
      ZRA_SCATTERINCNX16U(part, ZRA_ADDNX16U(greys, greys));
    }
    add_counts(part, counts);
  }
}

void look_up(const unsigned char* pixels, int count, const unsigned char* table, unsigned char* out) {
  const auto* in = reinterpret_cast<const qv_vecNx8U*>(pixels);
  auto* to = reinterpret_cast<qv_vecNx8U*>(out);
  for (int i = 0; i < count; i += LANES) {
    alignas(64) qv_vecNx16U greys;
    ZRA_LVNX8U_IP(greys, &in, sizeof(qv_vecNx8U));
    alignas(64) const qv_vecNx16U found = ZRA_GATHERDNX8U(ZRA_GATHERANX8U(table, greys));
    if (count - i >= LANES)
      ZRA_SVNX8U_IP(found, &to, sizeof(qv_vecNx8U));
    else
      ZRA_SVNX8UT_I(found, to, 0, first_lanes(count - i));
  }
}
