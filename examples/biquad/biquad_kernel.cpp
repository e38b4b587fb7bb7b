// The cascade as a kernel for the core, once for either precision: five fused operations a section.
#include <kastarri.h>
#include <kastarri/names.h>

#include "biquad/biquad.h"

namespace {

// The operations of the cascade in single precision. Conversions divide and multiply by 2^15, so that samples stand
// for -1 to 1.
struct Single {
  using Vector = qv_vecN_2xf32;
  static constexpr int lanes = SINGLE_LANES;
  static Vector constant(float value) { return Vector(value); }
  static Vector load(const short* x) {
    const auto* from = reinterpret_cast<const qv_vecN_2x16*>(x);
    return ZRA_FLOATN_2X32(qv_vecN_2x32v(qv_vecN_2x16_loadi(from, 0)), 15);
  }
  static void store(const Vector& v, short* y) {
    // The conversion saturates to 32 bits, not to the 16 of a sample: what is too loud is cut off before.
    const Vector bounded = ZRA_MAXN_2XF32(ZRA_MINN_2XF32(v, Vector(32767.0f / 32768)), Vector(-1.0f));
    const auto* to = reinterpret_cast<const qv_vecN_2x16*>(y);
    qv_vecN_2x16_storei(qv_vecN_2x16(ZRA_TRUNCN_2XF32(bounded, 15)), to, 0);
  }
  static Vector multiply(const Vector& a, const Vector& b) { return ZRA_MULN_2XF32(a, b); }
  static void add_product(Vector& sum, const Vector& a, const Vector& b) { ZRA_MULAN_2XF32(sum, a, b); }
  static void take_product(Vector& sum, const Vector& a, const Vector& b) { ZRA_MULSN_2XF32(sum, a, b); }
};

// The same in half precision.
struct Half {
  using Vector = qv_vecNxf16;
  static constexpr int lanes = HALF_LANES;
  static Vector constant(float value) { return Vector(value); }
  static Vector load(const short* x) {
    return ZRA_FLOATNX16(qv_vecNx16_loadi(reinterpret_cast<const qv_vecNx16*>(x), 0), 15);
  }
  static void store(const Vector& v, short* y) {
    qv_vecNx16_storei(ZRA_TRUNCNXF16(v, 15), reinterpret_cast<const qv_vecNx16*>(y), 0);
  }
  static Vector multiply(const Vector& a, const Vector& b) { return ZRA_MULNXF16(a, b); }
  static void add_product(Vector& sum, const Vector& a, const Vector& b) { ZRA_MULANXF16(sum, a, b); }
  static void take_product(Vector& sum, const Vector& a, const Vector& b) { ZRA_MULSNXF16(sum, a, b); }
};

template <class P>
void cascade(const Section* sections, int section_count, const short* x, short* y, int frames) {
  using Vector = typename P::Vector;
  struct alignas(64) Stage {
    Vector b0, b1, b2, a1, a2, s1, s2;
  };
  static Stage stages[MAX_SECTIONS];
  for (int k = 0; k < section_count; ++k) {
    const Section& s = sections[k];
    stages[k] = {P::constant(s.b0), P::constant(s.b1), P::constant(s.b2), P::constant(s.a1),
                 P::constant(s.a2), P::constant(0),    P::constant(0)};
  }
  for (int n = 0; n < frames; ++n, x += P::lanes, y += P::lanes) {
    alignas(64) Vector signal = P::load(x);
    for (int k = 0; k < section_count; ++k) {
      Stage& s = stages[k];
      alignas(64) Vector out = s.s1;
      P::add_product(out, s.b0, signal);
      s.s1 = s.s2;
      P::add_product(s.s1, s.b1, signal);
      P::take_product(s.s1, s.a1, out);
      s.s2 = P::multiply(s.b2, signal);
      P::take_product(s.s2, s.a2, out);
      signal = out;
    }
    P::store(signal, y);
  }
}

}  // namespace

void biquad_single(const Section* sections, int section_count, const short* x, short* y, int frames) {
  cascade<Single>(sections, section_count, x, y, frames);
}

void biquad_half(const Section* sections, int section_count, const short* x, short* y, int frames) {
  cascade<Half>(sections, section_count, x, y, frames);
}
