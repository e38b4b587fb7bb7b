// The sections of an equaliser: shelves and peaks (R. Bristow-Johnson's formulas).
#ifndef KASTARRI_EXAMPLES_BIQUAD_DESIGN_H
#define KASTARRI_EXAMPLES_BIQUAD_DESIGN_H

#include <cmath>
#include <complex>
#include <vector>

#include "biquad/biquad.h"
#include "common/spectrum.h"

namespace examples {

// `gain` dB at `frequency` (a fraction of the sample rate), over about 1 / q octaves.
inline Section peak(double frequency, double gain, double q) {
  const double w = 2 * PI * frequency, a = std::pow(10, gain / 40), alpha = std::sin(w) / (2 * q);
  const double a0 = 1 + alpha / a;
  const auto scaled = [a0](double c) { return static_cast<float>(c / a0); };
  return {scaled(1 + alpha * a), scaled(-2 * std::cos(w)), scaled(1 - alpha * a), scaled(-2 * std::cos(w)),
          scaled(1 - alpha / a)};
}

// `gain` dB below (side = 1) or above (side = -1) the frequency.
inline Section shelf(double frequency, double gain, int side) {
  const double w = 2 * PI * frequency, a = std::pow(10, gain / 40), c = side * std::cos(w);
  const double slope = 2 * std::sqrt(a) * std::sin(w) / std::sqrt(2.0);
  const double a0 = (a + 1) + (a - 1) * c + slope;
  const auto scaled = [a0](double x) { return static_cast<float>(x / a0); };
  return {scaled(a * ((a + 1) - (a - 1) * c + slope)), scaled(side * 2 * a * ((a - 1) - (a + 1) * c)),
          scaled(a * ((a + 1) - (a - 1) * c - slope)), scaled(side * -2 * ((a - 1) + (a + 1) * c)),
          scaled((a + 1) + (a - 1) * c - slope)};
}

// What the sections do to each frequency, in dB: size / 2 + 1 values from 0 Hz to half the sample rate.
inline std::vector<double> response(const std::vector<Section>& sections, std::size_t size) {
  std::vector<double> decibels;
  for (std::size_t k = 0; k <= size / 2; ++k) {
    const std::complex<double> z = std::polar(1.0, -2 * PI * static_cast<double>(k) / static_cast<double>(size));
    double power = 1;
    for (const Section& s : sections) {
      const double b0 = s.b0, b1 = s.b1, b2 = s.b2, a1 = s.a1, a2 = s.a2;
      power *= std::norm(b0 + b1 * z + b2 * z * z) / std::norm(1.0 + a1 * z + a2 * z * z);
    }
    decibels.push_back(10 * std::log10(power + 1e-20));
  }
  return decibels;
}

}  // namespace examples

#endif
