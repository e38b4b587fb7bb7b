// The cascade in plain C++, in single and in half precision. In both, a product and a sum are rounded once.
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>

#include "biquad/biquad.h"

namespace {

struct Single {
  static float number(float value) { return value; }
  static float multiply(float a, float b) { return a * b; }
  static float multiply_add(float a, float b, float c) { return std::fmaf(a, b, c); }
};

// Halves are kept in floats. A half has 11 significant bits and none below 2^-24: of a number from 2^e to 2^(e + 1) the
// last is 2^(e - 10), where e is at least -14. That is also the last bit of a double of the size of 1.5 2^(e + 42),
// as doubles have 53. So this rounds, to nearest and ties to even: add that double, and take it away again.
struct Half {
  static float number(double value) {
    std::uint64_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    bits &= 0x7FF0000000000000;  // sign and fraction off: 2^e is left
    double power;
    std::memcpy(&power, &bits, sizeof power);
    const double large = std::max(power, 0x1p-14) * 0x1.8p42;
    return static_cast<float>((value + large) - large);
  }
  static float multiply(float a, float b) { return multiply_add(a, b, 0); }
  // Products are multiples of 2^-48, and so are halves: below 32 a double, of 53 bits, holds their sum exactly.
  static float multiply_add(float a, float b, float c) { return number(static_cast<double>(a) * b + c); }
};

template <class P>
void cascade(const Section* sections, int section_count, const short* x, short* y, int frames) {
  Section rounded[MAX_SECTIONS];
  for (int k = 0; k < section_count; ++k) {
    const Section& s = sections[k];
    rounded[k] = {P::number(s.b0), P::number(s.b1), P::number(s.b2), P::number(s.a1), P::number(s.a2)};
  }
  float s1[MAX_SECTIONS] = {}, s2[MAX_SECTIONS] = {};
  for (int n = 0; n < frames; ++n) {
    float signal = P::number(static_cast<float>(x[n]) / 32768);
    for (int k = 0; k < section_count; ++k) {
      const Section& s = rounded[k];
      const float out = P::multiply_add(s.b0, signal, s1[k]);
      s1[k] = P::multiply_add(-s.a1, out, P::multiply_add(s.b1, signal, s2[k]));
      s2[k] = P::multiply_add(-s.a2, out, P::multiply(s.b2, signal));
      signal = out;
    }
    y[n] = static_cast<short>(std::min(std::max(signal * 32768, -32768.0f), 32767.0f));
  }
}

}  // namespace

void biquad_single_reference(const Section* sections, int section_count, const short* x, short* y, int frames) {
  cascade<Single>(sections, section_count, x, y, frames);
}

void biquad_half_reference(const Section* sections, int section_count, const short* x, short* y, int frames) {
  cascade<Half>(sections, section_count, x, y, frames);
}
