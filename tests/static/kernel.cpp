// Floats in a kernel; KERNEL is its name.
#include "kernel.h"

#include "kastarri/names.h"

Singles KERNEL(const Singles& a, const Singles& b, const Singles& c) {
  Singles sum = ZRA_MULN_2XF32(ZRA_ADDN_2XF32(a, b), ZRA_SUBN_2XF32(a, b));
  ZRA_MULAN_2XF32(sum, b, c);
  ZRA_MULSN_2XF32(sum, a, c);
  return ZRA_ADDN_2XF32(sum, ZRA_FIRINTN_2XF32(c));
}
Halves KERNEL(const Halves& a, const Halves& b, const Halves& c) {
  Halves sum = ZRA_MULNXF16(ZRA_ADDNXF16(a, b), ZRA_SUBNXF16(a, b));
  ZRA_MULANXF16(sum, b, c);
  ZRA_MULSNXF16(sum, a, c);
  return ZRA_ADDNXF16(sum, ZRA_FIRINTNXF16(c));
}
