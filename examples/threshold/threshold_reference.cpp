// The same in plain C++: what the kernels are checked against and timed against.
#include "threshold/threshold.h"

Part lighter_reference(const std::uint8_t* pixels, int count, int level) {
  Part part;
  for (int i = 0; i < count; ++i) {
    if (pixels[i] > level) {
      ++part.pixels;
      part.sum += pixels[i];
    }
  }
  return part;
}

void part_reference(const std::uint8_t* pixels, std::uint8_t* parted, int count, int level, int shift) {
  for (int i = 0; i < count; ++i) {
    const int pixel = pixels[i];
    parted[i] = static_cast<std::uint8_t>(pixel > level ? pixel + ((255 - pixel) >> shift) : pixel - (pixel >> shift));
  }
}
