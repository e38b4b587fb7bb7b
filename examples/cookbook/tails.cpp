// Tails: arrays whose length is not a multiple of the lanes.
#include <cstdio>

#include "kastarri/names.h"

// y[n] = x[n] + gain for any count. The predicate has a 1 for each number that is left, at most 32. Loads and stores
// under it touch whole registers in memory: x and y have room for 31 numbers more, which keep what they have.
void add(const short* x, short* y, int count, short gain) {
  const qv_vecNx16 more = gain;
  for (int n = 0; n < count; n += 32) {
    const vboolN rest = ZRA_LTRSN(count - n);
    const qv_vecNx16 v = ZRA_LVNX16T_I(reinterpret_cast<const qv_vecNx16*>(x + n), 0, rest);
    ZRA_SVNX16T_I(ZRA_ADDSNX16(v, more), reinterpret_cast<qv_vecNx16*>(y + n), 0, rest);
  }
}

// Without room behind the array: gathers and scatters leave elements alone whose bit is 0.
int sum_exactly(const short* x, int count) {
  static const unsigned short offsets[32] = {0,  2,  4,  6,  8,  10, 12, 14, 16, 18, 20, 22, 24, 26, 28, 30,
                                             32, 34, 36, 38, 40, 42, 44, 46, 48, 50, 52, 54, 56, 58, 60, 62};
  const qv_vecNx16U in_order = ZRA_LVNX16U_I(reinterpret_cast<const qv_vecNx16U*>(offsets), 0);
  int sum = 0;
  for (int n = 0; n < count; n += 32) {
    const qv_gsr found = ZRA_GATHERANX16T(x + n, in_order, ZRA_LTRSN(count - n));  // 0 in the other lanes
    sum += static_cast<int>(ZRA_RADDNX16(ZRA_GATHERDNX16(found))._[0]);
  }
  return sum;
}

int main() {
  short x[40 + 31], y[40 + 31];
  for (int n = 0; n < 71; ++n) {
    x[n] = static_cast<short>(n);
    y[n] = 99;
  }
  add(x, y, 40, 1000);
  std::printf("%d ... %d, and behind it %d\n", y[0], y[39], y[40]);

  const short few[3] = {5, 6, 7};
  std::printf("the sum of three: %d\n", sum_exactly(few, 3));
}
