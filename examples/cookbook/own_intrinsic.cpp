// Writing an intrinsic that is not built: when you know the rule of one that your kernel needs.
#include <cstdio>

#include "kastarri/lanes.h"
#include "kastarri/names.h"

// Lane by lane, from the words of your manual. This one moves the lanes whose bit is 1 together at the low end, in
// their order, and makes the others 0. Slow, and easy to trust: write this first, and keep it as the test of the other.
qv_vecNx16 compacted_by_lane(const qv_vecNx16& v, const vboolN& p) {
  qv_vecNx16 r = 0;
  int to = 0;
  for (int i = 0; i < kastarri::lane_count<qv_vecNx16>(); ++i) {
    if (kastarri::lane(p, i)) kastarri::set_lane(r, to++, kastarri::lane(v, i));
  }
  return r;
}

// Made of intrinsics, it runs on the core as well: the offsets of the lanes that stay, one behind the other, gather
// them.
qv_vecNx16 compacted(const qv_vecNx16& v, const vboolN& p) {
  unsigned short from[32] = {};
  int count = 0;
  for (unsigned bits = p._[0]; bits != 0; bits &= bits - 1)
    from[count++] = static_cast<unsigned short>(2 * __builtin_ctz(bits));
  const qv_vecNx16U offsets = ZRA_LVNX16U_I(reinterpret_cast<const qv_vecNx16U*>(from), 0);
  return ZRA_GATHERDNX16(ZRA_GATHERANX16T(reinterpret_cast<const short*>(&v), offsets, ZRA_LTRSN(count)));
}

int main() {
  const auto v = kastarri::by_lane<qv_vecNx16>([](int i) { return 100 + i; });
  int equal = 0;
  for (unsigned n = 0; n < 1000; ++n) {
    vboolN p;
    p._[0] = n * 2654435761u;
    equal += kastarri::equal(compacted(v, p), compacted_by_lane(v, p));
  }
  std::printf("%d of 1000 equal\n", equal);

  const qv_vecNx16 large = compacted(v, ZRA_GTNX16(v, 128));
  std::printf("%d %d %d %d\n", kastarri::lane(large, 0), kastarri::lane(large, 1), kastarri::lane(large, 2),
              kastarri::lane(large, 3));
}
