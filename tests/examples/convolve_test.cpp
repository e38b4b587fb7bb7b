// The convolution: its kernel on pictures of all widths, and what the filters do.
#include <gtest/gtest.h>

#include <cmath>
#include <random>

#include "convolve/filters.h"

namespace {

using namespace examples;

Picture convolved(const Picture& picture, const Filter& filter) {
  Convolved result(picture.width, picture.height);
  result.make(&convolve, Framed(picture), filter);
  return result.picture();
}

// A pixel beyond the edge is the nearest one inside.
double neighbour(const Picture& picture, int x, int y) {
  return picture.row(std::clamp(y, 0, picture.height - 1))[std::clamp(x, 0, picture.width - 1)];
}

TEST(Convolve, KernelIsExactUpToTheEdges) {
  std::mt19937 random(5);
  for (const int width : {1, 2, 63, 64, 65, 130}) {
    Picture picture(width, 7);
    for (auto& pixel : picture.pixels) pixel = static_cast<std::uint8_t>(random());
    Filter filter{std::vector<Mask>(2), MASK_RADIUS, 4};
    for (auto& mask : filter.masks)
      for (auto& row : mask.weight)
        for (auto& weight : row) weight = static_cast<signed char>(random());
    const Picture got = convolved(picture, filter);
    for (int y = 0; y < picture.height; ++y) {
      for (int x = 0; x < width; ++x) {
        double most = 0;
        for (const Mask& mask : filter.masks) {
          double sum = 0;
          for (int i = 0; i < MASK_SIZE * MASK_SIZE; ++i)
            sum += mask.weight[i / MASK_SIZE][i % MASK_SIZE] *
                   neighbour(picture, x + i % MASK_SIZE - MASK_RADIUS, y + i / MASK_SIZE - MASK_RADIUS);
          most = std::max(most, std::floor(sum / 16 + 0.5));
        }
        ASSERT_EQ(got.row(y)[x], std::min(most, 255.0)) << width << " wide, at " << x << ", " << y;
      }
    }
  }
}

TEST(Convolve, FiltersDoWhatTheyAreFor) {
  Picture halves(100, 20);
  for (int y = 0; y < halves.height; ++y)
    for (int x = 50; x < halves.width; ++x) halves.row(y)[x] = 200;
  const Picture edges = convolved(halves, sobel()), soft = convolved(halves, gauss());
  for (int y = 0; y < halves.height; ++y) {
    for (int x = 0; x < halves.width; ++x) ASSERT_EQ(edges.row(y)[x], x == 49 || x == 50 ? 200 : 0) << x << ", " << y;
    EXPECT_EQ(soft.row(y)[40], 0);
    EXPECT_EQ(soft.row(y)[60], 200);
    EXPECT_NEAR(soft.row(y)[49] + soft.row(y)[50], 200, 1);  // both rounded up
  }
}

}  // namespace
