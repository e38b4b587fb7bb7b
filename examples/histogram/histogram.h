// How often each grey occurs in a picture, and greys looked up in a table, twice: for the core and in plain C++.
//
// The kernels load whole registers: behind its pixels a picture has PIXEL_MARGIN bytes more, and behind its last
// entry the table has one more, of any value. They write no more than the results.
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
