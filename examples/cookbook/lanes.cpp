// Lanes in and out: arrays and single numbers into a register and back.
#include <cstdio>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

int main() {
  // As a kernel does it: a register is loaded from an array, any address will do, and stored to one.
  short samples[32], stored[32];
  for (int n = 0; n < 32; ++n) samples[n] = static_cast<short>(10 * n);
  const qv_vecNx16 x = ZRA_LVNX16_I(reinterpret_cast<const qv_vecNx16*>(samples), 0);
  ZRA_SVNX16_I(ZRA_NEGNX16(x), reinterpret_cast<qv_vecNx16*>(stored), 0);
  std::printf("stored: %d %d ... %d\n", stored[0], stored[1], stored[31]);

  // The same number in every lane, the number of one lane in every lane, and lane 0 as a number.
  const qv_vecNx16 seven = 7, fifth = ZRA_REPNX16(x, 5);
  std::printf("replicated: %d, %d\n", qv_vecNx16_rtor_int16(seven), qv_vecNx16_rtor_int16(fifth));

  // As a test does it: kastarri/lanes.h gives and takes single lanes, arrays and functions of the lane's number.
  qv_vecNx16 v = kastarri::from_lanes<qv_vecNx16>({1, 2, 3});  // the other lanes are 0
  kastarri::set_lane(v, 31, -4);
  int sum = 0;
  for (const short lane : kastarri::lanes(v)) sum += lane;
  std::printf("lane 2 is %d, the sum %d\n", kastarri::lane(v, 2), sum);

  const qv_vecNx48 acc = ZRA_MULNX16(v, kastarri::by_lane<qv_vecNx16>([](int i) { return 1000 * i; }));
  std::printf("lane 31 of the products: %lld\n", static_cast<long long>(kastarri::lane(acc, 31)));

  const vboolN even = kastarri::by_lane<vboolN>([](int i) { return i % 2 == 0; });
  std::printf("predicate: %08x\n", kastarri::parts<unsigned>(even)[0]);

  const qv_int32pr taps = kastarri::from_parts<qv_int32pr, short>({-1, 3});  // the low half first
  std::printf("coefficients: %08x\n", kastarri::lane(taps, 0));
  std::printf("equal: %d %d\n", kastarri::equal(x, x), kastarri::equal(x, v));
}
