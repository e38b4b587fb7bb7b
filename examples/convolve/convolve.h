// Convolution of an 8-bit picture with small masks, twice: for the core and in plain C++.
//
// A pixel becomes the largest of its responses to the masks: the sum of mask times neighbours, divided by
// 2^shift, rounded half up, clamped to 0 .. 255. `in` points to the first pixel of a picture that has
// MASK_RADIUS pixels more on every side; rows of `in` and `out` lie in_stride and out_stride pixels apart.
// Whole registers are loaded and stored: rows have CONVOLVE_MARGIN pixels more, which may hold anything.
#ifndef KASTARRI_EXAMPLES_CONVOLVE_H
#define KASTARRI_EXAMPLES_CONVOLVE_H

#include <cstdint>
#include <vector>

constexpr int MASK_RADIUS = 2;
constexpr int MASK_SIZE = 2 * MASK_RADIUS + 1;
constexpr int CONVOLVE_MARGIN = 63;

struct Mask {
  signed char weight[MASK_SIZE][MASK_SIZE];  // from the upper left neighbour
};

struct Filter {
  std::vector<Mask> masks;
  int radius;  // beyond it all weights are 0
  int shift;
};

void convolve(const std::uint8_t* in, int in_stride, const Filter& filter, std::uint8_t* out, int out_stride, int width,
              int height);
void convolve_reference(const std::uint8_t* in, int in_stride, const Filter& filter, std::uint8_t* out, int out_stride,
                        int width, int height);

#endif
