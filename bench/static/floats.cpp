#include "floats.h"

#ifdef PLAIN

void multiply_add_multiply(const float* a, const float* b, const float* c, const float* gain, float* __restrict y,
                           int samples) {
  for (int i = 0; i < samples; i += 16)
    for (int k = 0; k < 16; ++k) y[i + k] = __builtin_fmaf(a[i + k], b[i + k], c[i + k]) * gain[k];
}

#else

#include "kastarri.h"
#include "kastarri/names.h"

void multiply_add_multiply(const float* a, const float* b, const float* c, const float* gain, float* y, int samples) {
  using Vector = cstub_Km_ZNB_Orbis_R5_64k_qv_vecN_2xf32;
  const auto load = [](const float* at) { return ZRA_LVN_2XF32_I(reinterpret_cast<const Vector*>(at), 0); };
  const Vector g = load(gain);
  for (int i = 0; i < samples; i += 16) {
    Vector sum = load(c + i);
    ZRA_MULAN_2XF32(sum, load(a + i), load(b + i));
    ZRA_SVN_2XF32_I(ZRA_MULN_2XF32(sum, g), reinterpret_cast<Vector*>(y + i), 0);
  }
}

#endif
