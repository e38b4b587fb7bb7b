// Stride and deinterleave: every k-th number of an array into the lanes of a register, and back.
#include <cstdio>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

int main() {
  // Left and right by turns.
  short stereo[64];
  for (int n = 0; n < 32; ++n) {
    stereo[2 * n] = static_cast<short>(n);
    stereo[2 * n + 1] = static_cast<short>(-n);
  }

  // Numbers that lie k apart are 2 k bytes apart.
  const auto every_other = kastarri::by_lane<qv_vecNx16U>([](int i) { return 4 * i; });
  const qv_vecNx16 left = ZRA_GATHERDNX16(ZRA_GATHERANX16(stereo, every_other));
  const qv_vecNx16 right = ZRA_GATHERDNX16(ZRA_GATHERANX16(stereo + 1, every_other));
  std::printf("left %d %d ... %d, right %d %d ... %d\n", kastarri::lane(left, 0), kastarri::lane(left, 1),
              kastarri::lane(left, 31), kastarri::lane(right, 0), kastarri::lane(right, 1), kastarri::lane(right, 31));

  // And back, louder: a scatter writes lane i where offset i says.
  ZRA_SCATTERNX16(ZRA_SLLINX16(left, 1), stereo, every_other);
  ZRA_SCATTERNX16(ZRA_SLLINX16(right, 1), stereo + 1, every_other);
  std::printf("interleaved %d %d %d %d ...\n", stereo[0], stereo[1], stereo[2], stereo[3]);

  // Pairs without a gather, where lanes of 32 bits are wanted: such a lane is a pair, the number of lower address in
  // its low half.
  const qv_vecN_2x32v pairs = ZRA_LVN_2X32_I(reinterpret_cast<const qv_vecN_2x32v*>(stereo), 0);
  const qv_vecN_2x32v later = ZRA_SRAIN_2X32(pairs, 16);
  const qv_vecN_2x32v earlier = ZRA_SRAIN_2X32(ZRA_SLLIN_2X32(pairs, 16), 16);
  std::printf("shifted out %d and %d\n", kastarri::lane(earlier, 3), kastarri::lane(later, 3));
}
