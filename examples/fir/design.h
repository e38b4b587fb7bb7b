// The taps of windowed-sinc filters.
#ifndef KASTARRI_EXAMPLES_FIR_DESIGN_H
#define KASTARRI_EXAMPLES_FIR_DESIGN_H

#include <algorithm>
#include <cmath>
#include <vector>

#include "common/spectrum.h"

namespace examples {

enum class Pass { low, high, band };

// The ideal low-pass with the edge at `edge` (a fraction of the sample rate), `t` samples off its centre.
inline double ideal_low_pass(double edge, double t) {
  return t == 0 ? 2 * edge : std::sin(2 * PI * edge * t) / (PI * t);
}

// Q15 taps under a Hamming window, symmetric about their middle. Edges are fractions of the sample rate;
// `second` counts for a band-pass only. Scaled to a gain of 1 in the middle of what passes.
inline std::vector<short> design(Pass pass, double edge, double second, int tap_count) {
  const double middle = (tap_count - 1) / 2.0;
  std::vector<double> taps;
  for (int k = 0; k < tap_count; ++k) {
    const double t = k - middle;
    const double low = ideal_low_pass(edge, t);
    const double ideal = pass == Pass::low ? low : ideal_low_pass(pass == Pass::band ? second : 0.5, t) - low;
    taps.push_back(ideal * (0.54 + 0.46 * std::cos(PI * t / (middle + 0.5))));
  }
  const double passed = pass == Pass::low ? 0 : pass == Pass::high ? 0.5 : (edge + second) / 2;
  double gain = 0;
  for (int k = 0; k < tap_count; ++k)
    gain += taps[static_cast<std::size_t>(k)] * std::cos(2 * PI * passed * (k - middle));
  std::vector<short> q15;
  for (const double tap : taps) {
    q15.push_back(static_cast<short>(std::lround(std::min(std::max(tap / gain * 32768, -32768.0), 32767.0))));
  }
  return q15;
}

// What the taps do to each frequency, in dB: size / 2 + 1 values from 0 Hz to half the sample rate.
inline std::vector<double> response(const std::vector<short>& taps, std::size_t size) {
  std::vector<std::complex<double>> x(size);
  for (std::size_t k = 0; k < taps.size(); ++k) x[k] = taps[k] / 32768.0;
  fourier(x);
  std::vector<double> decibels;
  for (std::size_t k = 0; k <= size / 2; ++k) decibels.push_back(10 * std::log10(std::norm(x[k]) + 1e-20));
  return decibels;
}

}  // namespace examples

#endif
