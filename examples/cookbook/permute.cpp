// Permute and look up: lanes in any order, and a number from a table for each lane.
#include <cstdio>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

// Lane i = lane order[i] / 2 of v. Behind its address a register lies in memory, lane 0 first, and a gather loads lanes
// from there in the new order. Offsets are bytes: a lane of 16 bits lies at twice its number.
qv_vecNx16 permuted(const qv_vecNx16& v, const qv_vecNx16U& order) {
  return ZRA_GATHERDNX16(ZRA_GATHERANX16(reinterpret_cast<const short*>(&v), order));
}

int main() {
  const auto v = kastarri::by_lane<qv_vecNx16>([](int i) { return 100 + i; });

  const auto backwards = kastarri::by_lane<qv_vecNx16U>([](int i) { return 2 * (31 - i); });
  const qv_vecNx16 reversed = permuted(v, backwards);
  std::printf("reversed: %d %d ... %d\n", kastarri::lane(reversed, 0), kastarri::lane(reversed, 1),
              kastarri::lane(reversed, 31));

  const auto turned = kastarri::by_lane<qv_vecNx16U>([](int i) { return 2 * ((i + 3) % 32); });
  const qv_vecNx16 rotated = permuted(v, turned);
  std::printf("rotated:  %d %d ... %d\n", kastarri::lane(rotated, 0), kastarri::lane(rotated, 1),
              kastarri::lane(rotated, 31));

  // A table of squares. The numbers to look up are in lanes: twice a number is its offset.
  short squares[100];
  for (int n = 0; n < 100; ++n) squares[n] = static_cast<short>(n * n);
  const auto number = kastarri::by_lane<qv_vecNx16U>([](int i) { return 3 * i; });
  const qv_vecNx16 found = ZRA_GATHERDNX16(ZRA_GATHERANX16(squares, ZRA_ADDNX16U(number, number)));
  std::printf("looked up: %d %d ... %d\n", kastarri::lane(found, 0), kastarri::lane(found, 1),
              kastarri::lane(found, 31));
}
