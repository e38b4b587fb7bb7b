// The same in plain C++: what the kernels are checked against and timed against.
#include "histogram/histogram.h"

void count_greys_reference(const unsigned char* pixels, int count, unsigned* counts) {
  for (int g = 0; g < GREYS; ++g) counts[g] = 0;
  for (int i = 0; i < count; ++i) ++counts[pixels[i]];
}

void look_up_reference(const unsigned char* pixels, int count, const unsigned char* table, unsigned char* out) {
  for (int i = 0; i < count; ++i) out[i] = table[pixels[i]];
}
