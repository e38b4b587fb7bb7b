// The filters of the example, and pictures with room around them.
#ifndef KASTARRI_EXAMPLES_CONVOLVE_FILTERS_H
#define KASTARRI_EXAMPLES_CONVOLVE_FILTERS_H

#include <algorithm>

#include "common/pgm.h"
#include "convolve/convolve.h"

namespace examples {

// Rows of 1 4 6 4 1, the binomial coefficients, across rows of the same: close to a Gaussian bell.
inline Filter gauss() {
  constexpr int binomial[MASK_SIZE] = {1, 4, 6, 4, 1};
  Mask mask;
  for (int y = 0; y < MASK_SIZE; ++y)
    for (int x = 0; x < MASK_SIZE; ++x) mask.weight[y][x] = static_cast<signed char>(binomial[y] * binomial[x]);
  return {{mask}, 2, 8};
}

// The slope from left to right and from top to bottom, up and down: the steepest of the four is the edge.
inline Filter sobel() {
  constexpr int across[3] = {1, 2, 1}, along[3] = {-1, 0, 1};
  Filter filter{{}, 1, 2};
  for (const int sign : {1, -1}) {
    for (const bool down : {false, true}) {
      Mask mask{};
      for (int y = 0; y < 3; ++y)
        for (int x = 0; x < 3; ++x)
          mask.weight[y + 1][x + 1] =
              static_cast<signed char>(sign * (down ? along[y] * across[x] : across[y] * along[x]));
      filter.masks.push_back(mask);
    }
  }
  return filter;
}

// The picture with its edge pixels repeated outwards.
struct Framed {
  explicit Framed(const Picture& picture) : stride(picture.width + 2 * MASK_RADIUS + CONVOLVE_MARGIN) {
    const int rows = picture.height + 2 * MASK_RADIUS;
    pixels.resize(static_cast<std::size_t>(rows) * static_cast<std::size_t>(stride));
    for (int y = 0; y < rows; ++y) {
      const std::uint8_t* const from = picture.row(std::clamp(y - MASK_RADIUS, 0, picture.height - 1));
      for (int x = 0; x < stride; ++x)
        pixels[static_cast<std::size_t>(y) * static_cast<std::size_t>(stride) + static_cast<std::size_t>(x)] =
            from[std::clamp(x - MASK_RADIUS, 0, picture.width - 1)];
    }
  }
  const std::uint8_t* first() const { return &pixels[static_cast<std::size_t>(MASK_RADIUS * stride + MASK_RADIUS)]; }

  int stride;
  std::vector<std::uint8_t> pixels;
};

using Convolution = void(const std::uint8_t*, int, const Filter&, std::uint8_t*, int, int, int);

// A convolved picture. The result is made in rows with a margin, and cut.
struct Convolved {
  Convolved(int columns, int rows)
      : width(columns),
        height(rows),
        stride(columns + CONVOLVE_MARGIN),
        pixels(static_cast<std::size_t>(stride) * static_cast<std::size_t>(rows)) {}
  void make(Convolution* convolution, const Framed& in, const Filter& filter) {
    convolution(in.first(), in.stride, filter, pixels.data(), stride, width, height);
  }
  Picture picture() const {
    Picture cut(width, height);
    for (int y = 0; y < height; ++y) std::copy_n(&pixels[static_cast<std::size_t>(y * stride)], width, cut.row(y));
    return cut;
  }

  int width, height, stride;
  std::vector<std::uint8_t> pixels;
};

}  // namespace examples

#endif
