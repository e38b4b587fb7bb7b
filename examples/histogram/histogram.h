// How often each grey occurs in a picture, and greys looked up in a table, twice: for the core and in plain C++.
//
// The kernels load and store whole registers: behind its pixels a picture has PIXEL_MARGIN more, and the
// table one entry more, which make no difference and stay as they are.
#ifndef KASTARRI_EXAMPLES_HISTOGRAM_H
#define KASTARRI_EXAMPLES_HISTOGRAM_H

constexpr int GREYS = 256;
constexpr int PIXEL_MARGIN = 31;

// counts[g] = how many of the pixels are g.
void count_greys(const unsigned char* pixels, int count, unsigned* counts);
void count_greys_reference(const unsigned char* pixels, int count, unsigned* counts);

// out[i] = table[pixels[i]].
void look_up(const unsigned char* pixels, int count, const unsigned char* table, unsigned char* out);
void look_up_reference(const unsigned char* pixels, int count, const unsigned char* table, unsigned char* out);

#endif
