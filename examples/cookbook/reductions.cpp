// Reductions: one number of many, and where it is.
#include <cstdio>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

// The sum of x[n] * y[n]; count is a multiple of 32. Lanes are summed to the end in the accumulator, 2^17 - 1 products
// of the greatest size without overflow, and added up once behind the loop.
long long dot(const short* x, const short* y, int count) {
  const qv_vecNx16* a = reinterpret_cast<const qv_vecNx16*>(x);
  const qv_vecNx16* b = reinterpret_cast<const qv_vecNx16*>(y);
  qv_vecNx48 sums = ZRA_ZERONX48();
  for (int n = 0; n < count; n += 32, ++a, ++b) ZRA_MULANX16(sums, ZRA_LVNX16_I(a, 0), ZRA_LVNX16_I(b, 0));
  // In a kernel the accumulator goes to words by PACKVRNX48_0 and _1, which saturate, and those through RADDN_2X32.
  long long sum = 0;
  for (const long long lane : kastarri::lanes(sums)) sum += lane;
  return sum;
}

int main() {
  short x[64], y[64];
  for (int n = 0; n < 64; ++n) {
    x[n] = static_cast<short>(1000 - (n - 40) * (n - 40));
    y[n] = 30000;
  }
  std::printf("dot product: %lld\n", dot(x, y, 64));

  const qv_vecNx16 v = ZRA_LVNX16_I(reinterpret_cast<const qv_vecNx16*>(x + 20), 0);
  std::printf("sum %d, largest %d, smallest %d\n", kastarri::lane(ZRA_RADDNX16(v), 0),
              kastarri::lane(ZRA_RMAXNX16(v), 0), kastarri::lane(ZRA_RMINNX16(v), 0));

  // Where the largest is: compare all lanes with it. The lowest bit that is 1 is its first place.
  const vboolN largest = ZRA_EQNX16(v, qv_vecNx16(ZRA_RMAXNX16(v)));
  std::printf("first at lane %d\n", __builtin_ctz(largest._[0]));

  // Of some lanes only, and whether any lane is below 0.
  const vboolN high = ZRA_GTNX16(v, 900);
  std::printf("sum of those above 900: %d, any below 0: %d\n", kastarri::lane(ZRA_RADDNX16T(v, high), 0),
              ZRA_RORBN(ZRA_LTNX16(v, 0))._[0]);
}
