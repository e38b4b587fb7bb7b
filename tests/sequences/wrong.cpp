// A few intrinsics, wrong in ways that calls one by one do not show. It is loaded before the library; WRONG says which
// of them is to be wrong.
#include <cstdlib>
#include <cstring>

#include "kastarri/names.h"

namespace {

bool is_wrong(const char* what) {
  const char* const wrong = std::getenv("WRONG");
  return wrong && std::strcmp(wrong, what) == 0;
}

}  // namespace

// Cleared before the operands are read: wrong where the result is one of them.
void ZRA_ADDNX16T(qv_vecNx16& r, const qv_vecNx16& a, const qv_vecNx16& b, const vboolN& p) {
  short old[32], sum[32];
  std::memcpy(old, &r, sizeof old);
  if (is_wrong("in place")) std::memset(&r, 0, sizeof r);
  for (int i = 0; i < 32; ++i) {
    short x, y;
    std::memcpy(&x, reinterpret_cast<const char*>(&a) + 2 * i, sizeof x);
    std::memcpy(&y, reinterpret_cast<const char*>(&b) + 2 * i, sizeof y);
    sum[i] = p._[0] >> i & 1 ? static_cast<short>(x + y) : old[i];
  }
  std::memcpy(&r, sum, sizeof sum);
}

// The load is right, and so is the pointer but for odd increments.
void ZRA_LVNX16_IP(qv_vecNx16& r, const qv_vecNx16** pointer, int increment) {
  const char* const from = reinterpret_cast<const char*>(*pointer);
  std::memcpy(&r, from, sizeof r);
  *pointer = reinterpret_cast<const qv_vecNx16*>(from + (is_wrong("pointer") ? increment & ~1 : increment));
}

// Ends the program under a rounding mode.
qv_vecNx16 ZRA_NEGNX16(const qv_vecNx16& a) {
  if (is_wrong("mode") && cstub_Km_ZNB_Orbis_R5_64k_proc.states.RoundMode == 2) std::abort();
  return ZRA_SUBNX16(ZRA_ZERONX16(), a);
}
