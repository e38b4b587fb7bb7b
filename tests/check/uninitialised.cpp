// An accumulator that is not cleared, and one that is.
#include <cstdio>

#include "kastarri/names.h"

int main(int argc, char**) {
  short samples[64] = {1, 2, 3}, out[32];
  const qv_vecNx16 x = ZRA_LVNX16_I(reinterpret_cast<const qv_vecNx16*>(samples), 0);
  qv_vecNx48 acc;
  if (argc > 1) acc = ZRA_MULNX16(x, x);
  ZRA_MULANX16(acc, x, x);
  ZRA_SVNX16_I(ZRA_PACKVRNX48(acc, 0), reinterpret_cast<qv_vecNx16*>(out), 0);
  if (out[3] != 0) std::puts("some");  // it matters here
}
