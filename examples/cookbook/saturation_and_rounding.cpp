// Saturation and rounding: what becomes of numbers that do not fit.
#include <cstdio>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

int main() {
  // Sums wrap, unless S stands in the name: then they stop at the ends of the range.
  const qv_vecNx16 loud = 30000;
  std::printf("30000 + 30000: %d wrapped, %d saturated, %d halved\n", kastarri::lane(ZRA_ADDNX16(loud, loud), 0),
              kastarri::lane(ZRA_ADDSNX16(loud, loud), 0), kastarri::lane(ZRA_AVGNX16(loud, loud), 0));

  // The most negative number has no positive one of its size.
  const qv_vecNx16 lowest = -32768;
  std::printf("|-32768|: %d wrapped, %d saturated\n", kastarri::lane(ZRA_ABSNX16(lowest), 0),
              kastarri::lane(ZRA_ABSSNX16(lowest), 0));

  // Out of the accumulator: 2.5, -2.5, 2.75 and 40000 with two bits behind the point.
  const auto x = kastarri::from_lanes<qv_vecNx16>({5, -5, 11, 20000});
  const qv_vecNx48 acc = ZRA_MULNX16(x, kastarri::from_lanes<qv_vecNx16>({2, 2, 1, 8}));
  const qv_vecNx16 low_bits = ZRA_PACKLNX48(acc), rounded = ZRA_PACKVRNX48(acc, 2), cut = ZRA_PACKVRNRNX48(acc, 2);
  for (int i = 0; i < 4; ++i)
    std::printf("%7lld / 4: rounded half up %d, rounded down %d, its low bits %d\n",
                static_cast<long long>(kastarri::lane(acc, i)), kastarri::lane(rounded, i), kastarri::lane(cut, i),
                kastarri::lane(low_bits, i));

  // Floats round as RoundMode says: 0 to the nearest, 1 toward zero, 2 up, 3 down. What happened stays in StickyFlags.
  cstub_Km_ZNB_Orbis_R5_64k_states_t& states = cstub_Km_ZNB_Orbis_R5_64k_proc.states;
  const qv_vecN_2xf32 one = 1.0f, three = 3.0f, third = 1.0f / 3;
  for (states.RoundMode = 0; states.RoundMode < 4; ++states.RoundMode) {
    qv_vecN_2xf32 rest = one;
    ZRA_MULSN_2XF32(rest, three, third);  // 1 - 3 * (1/3), rounded once
    const qv_vecN_2xf32 sum = ZRA_ADDN_2XF32(one, third);
    std::printf("mode %u: %.9f, rest %g\n", states.RoundMode, kastarri::lane(sum, 0), kastarri::lane(rest, 0));
  }
  std::printf("flags %u: inexact\n", states.StickyFlags);
  states.RoundMode = 0;
}
