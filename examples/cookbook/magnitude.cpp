// Magnitude: how long complex numbers are, exactly squared and roughly.
#include <cmath>
#include <cstdio>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

// The product of z and its conjugate is |z|^2 in the even lanes and 0 in the odd ones. In the accumulator it is exact;
// packed it is Q15 in words, where 1 is 32768.
qv_vecN_2x32v squared(const qv_vecNx16& z) { return ZRA_PACKVRNX48_0(ZRA_MULNX16J(z, z), 15); }

// About |z| without a root: the larger part and 3/8 of the smaller one, from 2.8 % below to 6.8 % above it. The parts
// of 32 numbers are in registers of their own, and up to 23,000 in size.
qv_vecNx16 roughly(const qv_vecNx16& re, const qv_vecNx16& im) {
  const qv_vecNx16 a = ZRA_ABSSNX16(re), b = ZRA_ABSSNX16(im);
  const qv_vecNx16 larger = ZRA_MAXNX16(a, b), smaller = ZRA_MINNX16(a, b);
  const qv_vecNx16 three_eighths = ZRA_ADDNX16(ZRA_SRAINX16(smaller, 2), ZRA_SRAINX16(smaller, 3));
  return ZRA_ADDSNX16(larger, three_eighths);
}

int main() {
  const auto z = kastarri::from_lanes<qv_vecNx16>({3000, -4000, 32767, 32767, -5, 12});  // 3000 - 4000i, ...
  const qv_vecN_2x32v power = squared(z);
  for (int k = 0; k < 3; ++k)  // the root is the host's, where a kernel has none
    std::printf("|z|^2 = %d in Q15, |z| = %.1f\n", kastarri::lane(power, k),
                std::sqrt(32768.0 * kastarri::lane(power, k)));

  const auto re = kastarri::from_lanes<qv_vecNx16>({3000, 20000, 20000}),
             im = kastarri::from_lanes<qv_vecNx16>({-4000, 20000, 0});
  const qv_vecNx16 length = roughly(re, im);
  for (int k = 0; k < 3; ++k)
    std::printf("about %d for %.1f\n", kastarri::lane(length, k),
                std::hypot(kastarri::lane(re, k), kastarri::lane(im, k)));
}
