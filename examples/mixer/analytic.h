// A real sound as a complex one without negative frequencies, and a complex carrier.
#ifndef KASTARRI_EXAMPLES_MIXER_ANALYTIC_H
#define KASTARRI_EXAMPLES_MIXER_ANALYTIC_H

#include <algorithm>
#include <cmath>
#include <complex>
#include <vector>

#include "common/spectrum.h"

namespace examples {

inline short to_q15(double value) {
  return static_cast<short>(std::lround(std::min(std::max(value, -32768.0), 32767.0)));
}

// Numbers follow each other, real part first; zeros fill them up to a multiple of `block`.
inline std::vector<short> interleaved(const std::vector<std::complex<double>>& numbers, std::size_t count,
                                      std::size_t block) {
  std::vector<short> parts(2 * ((count + block - 1) / block * block), 0);
  for (std::size_t n = 0; n < count; ++n) {
    parts[2 * n] = to_q15(numbers[n].real());
    parts[2 * n + 1] = to_q15(numbers[n].imag());
  }
  return parts;
}

// The sound as the real part of numbers whose spectrum has its positive half only: multiplied by a
// carrier they move as a whole, where the sound itself would move up and down at once.
inline std::vector<short> analytic(const std::vector<short>& sound, std::size_t block) {
  std::size_t size = 2;
  while (size < sound.size()) size *= 2;
  std::vector<std::complex<double>> x(size);
  for (std::size_t n = 0; n < sound.size(); ++n) x[n] = sound[n];
  fourier(x);
  for (std::size_t k = 1; k < size / 2; ++k) x[k] *= 2;
  for (std::size_t k = size / 2 + 1; k < size; ++k) x[k] = 0;
  // The transform of the conjugate is the conjugate of the inverse.
  for (auto& value : x) value = std::conj(value);
  fourier(x);
  for (auto& value : x) value = std::conj(value) / static_cast<double>(size);
  return interleaved(x, sound.size(), block);
}

// A full turn every 1 / frequency numbers; a frequency is a fraction of the sample rate.
inline std::vector<short> carrier(double frequency, std::size_t count, std::size_t block) {
  std::vector<std::complex<double>> w(count);
  for (std::size_t n = 0; n < count; ++n) {
    const double turns = std::fmod(frequency * static_cast<double>(n), 1);
    w[n] = std::polar(32767.0, 2 * PI * turns);
  }
  return interleaved(w, count, block);
}

}  // namespace examples

#endif
