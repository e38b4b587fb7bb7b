// A module with kernels for the core: those of the examples, and two as they are written plainly.
#include <kastarri.h>
#include <kastarri/names.h>

#include "kernels.h"

namespace {

// No variable is aligned, every result is assigned: what a compiler makes of that is what is timed.
void chain(const short* x, const short* taps, int tap_count, short* y, int count) {
  qv_vecNx16 tap[FIR_MAX_TAPS];
  for (int k = 0; k < tap_count; ++k) tap[k] = taps[k];
  for (int n = 0; n < count; n += 32) {
    qv_vecNx48 sum = 0;
    for (int k = 0; k < tap_count; ++k) {
      qv_vecNx16 v = ZRA_LVNX16_I(reinterpret_cast<const qv_vecNx16*>(x + n + k), 0);
      ZRA_MULANX16(sum, v, tap[k]);
    }
    qv_vecNx16 filtered = ZRA_PACKVRNX48(sum, 15);
    ZRA_SVNX16_I(filtered, reinterpret_cast<qv_vecNx16*>(y + n), 0);
  }
}

// The same with registers where they are told to lie. Compilers put variables at any multiple of 4 or 16.
struct Frame {
  qv_vecNx16 tap[CHAIN_TAPS], sample, filtered;
  qv_vecNx48 sum;
};
static_assert(sizeof(Frame) + 64 <= CHAIN_FRAME, "");

void chain_at(const short* x, const short* taps, short* y, int count, void* frame) {
  Frame& r = *static_cast<Frame*>(frame);
  for (int k = 0; k < CHAIN_TAPS; ++k) r.tap[k] = taps[k];
  for (int n = 0; n < count; n += 32) {
    const auto* in = reinterpret_cast<const qv_vecNx16*>(x + n);
    auto* out = reinterpret_cast<qv_vecNx16*>(y + n);
    r.sum = 0;
    for (int k = 0; k < CHAIN_TAPS; ++k) {
      ZRA_LVNX16_IP(r.sample, &in, sizeof(short));
      ZRA_MULANX16(r.sum, r.sample, r.tap[k]);
    }
    r.filtered = ZRA_PACKVRNX48(r.sum, 15);
    ZRA_SVNX16_IP(r.filtered, &out, sizeof r.filtered);
  }
}

}  // namespace

void multiply_add_multiply(const float* a, const float* b, const float* c, const float* gain, float* y, int samples) {
  const auto load = [](const float* at) { return ZRA_LVN_2XF32_I(reinterpret_cast<const qv_vecN_2xf32*>(at), 0); };
  const qv_vecN_2xf32 g = load(gain);
  for (int i = 0; i < samples; i += 16) {
    qv_vecN_2xf32 sum = load(c + i);
    ZRA_MULAN_2XF32(sum, load(a + i), load(b + i));
    ZRA_SVN_2XF32_I(ZRA_MULN_2XF32(sum, g), reinterpret_cast<qv_vecN_2xf32*>(y + i), 0);
  }
}

extern "C" __attribute__((visibility("default"))) const Kernels kernels;
const Kernels kernels = {fir, convolve, chain, chain_at, multiply_add_multiply, count_greys, look_up};
