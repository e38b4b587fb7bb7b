// Select: from each lane of two registers the one that a predicate names.
#include <cstdio>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

// Lane i of a where bit i is 1, else of b. A predicated form keeps what the destination has where the bit is 0: put b
// there, and write a over it. The smaller of a and a is a.
qv_vecNx16 select(const qv_vecNx16& a, const qv_vecNx16& b, const vboolN& p) {
  qv_vecNx16 r = b;
  ZRA_MINNX16T(r, a, a, p);
  return r;
}

int main() {
  const auto x = kastarri::by_lane<qv_vecNx16>([](int i) { return 100 * (i - 16); });
  const qv_vecNx16 zero = 0;

  // What is below 0 becomes 0 ...
  const qv_vecNx16 cut = select(zero, x, ZRA_LTNX16(x, zero));
  std::printf("select:     %d %d %d\n", kastarri::lane(cut, 0), kastarri::lane(cut, 15), kastarri::lane(cut, 31));

  // ... for which there is a shorter way: where one of the two is computed, compute it under the predicate.
  qv_vecNx16 size = x;
  ZRA_NEGNX16T(size, x, ZRA_LTNX16(x, zero));
  std::printf("predicated: %d %d %d\n", kastarri::lane(size, 0), kastarri::lane(size, 15), kastarri::lane(size, 31));

  // Between two bounds no predicate is needed.
  const qv_vecNx16 low = -1000, high = 1000;
  const qv_vecNx16 bounded = ZRA_MINNX16(ZRA_MAXNX16(x, low), high);
  std::printf("bounded:    %d %d %d\n", kastarri::lane(bounded, 0), kastarri::lane(bounded, 15),
              kastarri::lane(bounded, 31));
}
