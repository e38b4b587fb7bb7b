// A cascade of biquads, an equaliser, in single and in half precision on the core, and in plain C++.
//
// A section makes a sample y of a sample x, and keeps s1 and s2 for the next one (the transposed direct form II):
//
//   y = b0 x + s1,   s1 = (s2 + b1 x) - a1 y,   s2 = b2 x - a2 y
//
// where each product is rounded once, together with the sum that it is part of. What a filter makes of a sample
// depends on the one before, so samples of one sound cannot be the lanes of a register. Each lane has a sound of its
// own: x and y hold the first sample of each, then the second of each, and so on, as 16-bit samples that stand for
// -1 to 1.
#ifndef KASTARRI_EXAMPLES_BIQUAD_H
#define KASTARRI_EXAMPLES_BIQUAD_H

struct Section {
  float b0, b1, b2, a1, a2;
};

constexpr int MAX_SECTIONS = 16;
constexpr int SINGLE_LANES = 16;
constexpr int HALF_LANES = 32;

// x and y are frames * lanes samples; y is truncated toward zero, and full scale where it is beyond.
void biquad_single(const Section* sections, int section_count, const short* x, short* y, int frames);
void biquad_half(const Section* sections, int section_count, const short* x, short* y, int frames);
// The same of one sound, frames samples.
void biquad_single_reference(const Section* sections, int section_count, const short* x, short* y, int frames);
void biquad_half_reference(const Section* sections, int section_count, const short* x, short* y, int frames);

#endif
