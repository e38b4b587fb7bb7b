// A cascade of biquads, an equaliser, in single and in half precision on the core, and in plain C++.
//
// A section is y = b0 x + s1, s1 = b1 x - a1 y + s2, s2 = b2 x - a2 y (the transposed direct form II), each
// product and sum rounded once. What a filter makes of a sample depends on the one before, so the lanes of
// a register hold sounds of their own: LANES of them, frame by frame, as 16-bit samples that stand for
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
// One sound, in single precision.
void biquad_reference(const Section* sections, int section_count, const short* x, short* y, int frames);

#endif
