// A module with the same work as loops that compilers vectorise: blocks of neighbouring results, the tap outside the
// inner loop, sums as wide as the core's (64 bits for its 48, 32 for its 24).
#include <algorithm>

#include "kernels.h"

namespace {

#ifndef BLOCK
#define BLOCK 16
#endif

template <class T>
T clamped(long long value, int low, int high) {
  return static_cast<T>(value < low ? low : value > high ? high : value);
}

void fir_native(const short* __restrict x, const short* __restrict taps, int tap_count, short* __restrict y,
                int count) {
  for (int n = 0; n < count; n += BLOCK) {
    long long sum[BLOCK] = {};
    for (int k = 0; k < tap_count; ++k) {
      const int tap = taps[k];
      for (int i = 0; i < BLOCK; ++i) sum[i] += x[n + k + i] * tap;
    }
    const int size = std::min(BLOCK, count - n);
    short out[BLOCK];
    for (int i = 0; i < BLOCK; ++i) out[i] = clamped<short>((sum[i] + 0x4000) >> 15, -32768, 32767);
    std::copy_n(out, size, y + n);
  }
}

struct Tap {
  int offset, weight;
};

std::vector<Tap> taps_of(const Mask& mask, int radius, int stride) {
  std::vector<Tap> taps;
  for (int v = -radius; v <= radius; ++v) {
    for (int u = -radius; u <= radius; ++u) {
      const int weight = mask.weight[v + MASK_RADIUS][u + MASK_RADIUS];
      if (weight != 0) taps.push_back({v * stride + u, weight});
    }
  }
  return taps;
}

void convolve_native(const std::uint8_t* __restrict in, int in_stride, const Filter& filter,
                     std::uint8_t* __restrict out, int out_stride, int width, int height) {
  std::vector<std::vector<Tap>> masks;
  for (const Mask& mask : filter.masks) masks.push_back(taps_of(mask, filter.radius, in_stride));
  const int shift = filter.shift, half = shift > 0 ? 1 << (shift - 1) : 0;
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; x += BLOCK) {
      const std::uint8_t* const from = in + y * in_stride + x;
      int most[BLOCK] = {};
      for (const auto& mask : masks) {
        int sum[BLOCK] = {};
        for (const Tap& tap : mask)
          for (int i = 0; i < BLOCK; ++i) sum[i] += tap.weight * from[tap.offset + i];
        for (int i = 0; i < BLOCK; ++i) most[i] = std::max(most[i], std::min((sum[i] + half) >> shift, 255));
      }
      for (int i = 0; i < BLOCK; ++i) out[y * out_stride + x + i] = static_cast<std::uint8_t>(most[i]);
    }
  }
}

}  // namespace

void multiply_add_multiply(const float* a, const float* b, const float* c, const float* gain, float* __restrict y,
                           int samples) {
  for (int i = 0; i < samples; i += 16)
    for (int k = 0; k < 16; ++k) y[i + k] = __builtin_fmaf(a[i + k], b[i + k], c[i + k]) * gain[k];
}

extern "C" __attribute__((visibility("default"))) const Kernels kernels;
const Kernels kernels = {
    fir_native, convolve_native, fir_native, nullptr, multiply_add_multiply, count_greys_reference, look_up_reference};
