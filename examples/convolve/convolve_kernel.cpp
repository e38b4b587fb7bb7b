// The convolution as a kernel for the core: 64 pixels at a time, four weights a multiply-accumulate.
#include <kastarri.h>
#include <kastarri/names.h>

#include "convolve/convolve.h"

namespace {

// Up to four neighbours and their weights in one word, as the quad multiplications take them, the first in the top
// byte: weights 1, 2, -1 are 0x0102FF00. A quad of fewer than four has weights of 0 in their place.
struct Quad {
  int offset[4] = {};
  qv_int32pr weights{0};
};

// The neighbours whose weight is not 0.
std::vector<Quad> quads_of(const Mask& mask, int stride) {
  std::vector<Quad> quads;
  int used = 4;
  for (int y = 0; y < MASK_SIZE; ++y) {
    for (int x = 0; x < MASK_SIZE; ++x) {
      if (mask.weight[y][x] == 0) continue;
      if (used == 4) quads.emplace_back(), used = 0;
      quads.back().offset[used] = (y - MASK_RADIUS) * stride + x - MASK_RADIUS;
      quads.back().weights._[0] |= static_cast<unsigned>(static_cast<unsigned char>(mask.weight[y][x]))
                                   << (24 - 8 * used);
      ++used;
    }
  }
  return quads;
}

qv_vec2Nx8U at(const std::uint8_t* pixel, int offset) {
  return qv_vec2Nx8U_loadi(reinterpret_cast<const qv_vec2Nx8U*>(pixel), offset);
}

qv_vec2Nx8U response(const std::uint8_t* pixel, const std::vector<Quad>& quads, int shift) {
  // On the PC registers lie in memory. Aligned to 64 bytes, each is in one cache line, which is quickest.
  alignas(64) qv_vec2Nx24 sum(0);
  for (const Quad& q : quads) {
    alignas(64) const qv_vec2Nx8U a = at(pixel, q.offset[0]), b = at(pixel, q.offset[1]);
    alignas(64) const qv_vec2Nx8U c = at(pixel, q.offset[2]), d = at(pixel, q.offset[3]);
    ZRA_MULUSQA2N8XR8(sum, a, b, c, d, q.weights);
  }
  return ZRA_PACKVRU2NX24(sum, shift);
}

}  // namespace

void convolve(const std::uint8_t* in, int in_stride, const Filter& filter, std::uint8_t* out, int out_stride, int width,
              int height) {
  std::vector<std::vector<Quad>> masks;
  for (const Mask& mask : filter.masks) masks.push_back(quads_of(mask, in_stride));
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; x += 64) {
      const std::uint8_t* const pixel = in + static_cast<std::ptrdiff_t>(y) * in_stride + x;
      alignas(64) qv_vec2Nx8U most(0);
      for (const auto& quads : masks) {
        alignas(64) const qv_vec2Nx8U one = response(pixel, quads, filter.shift);
        most = ZRA_MAXU2NX8U(most, one);
      }
      qv_vec2Nx8U_storei(most, reinterpret_cast<qv_vec2Nx8U*>(out + static_cast<std::ptrdiff_t>(y) * out_stride + x),
                         0);
    }
  }
}
