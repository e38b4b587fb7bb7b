// The same in plain C++: what the kernel is checked against, bit for bit, and timed against.
#include "convolve/convolve.h"

static int response(const std::uint8_t* pixel, int stride, const Mask& mask, int radius, int shift) {
  int sum = 0;
  for (int y = -radius; y <= radius; ++y) {
    for (int x = -radius; x <= radius; ++x)
      sum += mask.weight[y + MASK_RADIUS][x + MASK_RADIUS] * pixel[y * stride + x];
  }
  const int rounded = (sum + (shift > 0 ? 1 << (shift - 1) : 0)) >> shift;
  return rounded < 0 ? 0 : rounded > 255 ? 255 : rounded;
}

void convolve_reference(const std::uint8_t* in, int in_stride, const Filter& filter, std::uint8_t* out, int out_stride,
                        int width, int height) {
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      int most = 0;
      for (const Mask& mask : filter.masks) {
        const int one = response(in + y * in_stride + x, in_stride, mask, filter.radius, filter.shift);
        most = one > most ? one : most;
      }
      out[y * out_stride + x] = static_cast<std::uint8_t>(most);
    }
  }
}
