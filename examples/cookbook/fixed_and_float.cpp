// Fixed point and floats: from one to the other and back.
#include <cstdio>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

int main() {
  // Samples are Q15: 16384 stands for 0.5. The immediate says how many bits lie behind the point.
  const auto q15 = kastarri::from_lanes<qv_vecN_2x32v>({16384, -8192, 1, 32767});
  const qv_vecN_2xf32 x = ZRA_FLOATN_2X32(q15, 15);
  std::printf("floats: %g %g %g %g\n", kastarri::lane(x, 0), kastarri::lane(x, 1), kastarri::lane(x, 2),
              kastarri::lane(x, 3));

  // The way back cuts off what lies behind the last bit, toward 0. Half a unit added before rounds to the nearest:
  // 0.7 / 32768 is 0 and then 1.
  const auto y = kastarri::from_lanes<qv_vecN_2xf32>({0.7f / 32768, -0.7f / 32768, 0.25f, 3.0f});
  const qv_vecN_2x32v cut = ZRA_TRUNCN_2XF32(y, 15);
  const qv_vecN_2x32v rounded = ZRA_TRUNCN_2XF32(ZRA_FIROUNDN_2XF32(ZRA_MULN_2XF32(y, 32768.0f)), 0);
  for (int i = 0; i < 4; ++i) std::printf("cut %d, rounded %d\n", kastarri::lane(cut, i), kastarri::lane(rounded, i));

  // 3.0 is 98304, which 32 bits hold and a sample does not: the store saturates.
  short samples[16];
  ZRA_SVN_2X16S_I(rounded, reinterpret_cast<qv_vecN_2x16*>(samples), 0);
  std::printf("stored %d %d\n", samples[2], samples[3]);

  // Halves keep 11 bits of a number: half the room, and 32 lanes, but 0.1 is 0.09998.
  const qv_vecNxf16 half = ZRA_CVTF16N_2XF32_0(0.1f);
  std::printf("a half: %.5f, its bits %llx\n", kastarri::lane(half, 0), kastarri::lane_bits(half, 0));
}
