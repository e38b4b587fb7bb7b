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

// Complex numbers as the kernel takes them: real part, imaginary part, real part, and so on, with zeros behind them up
// to a multiple of `block` numbers.
inline std::vector<short> interleaved(const std::vector<std::complex<double>>& numbers, std::size_t count,
                                      std::size_t block) {
  std::vector<short> parts(2 * ((count + block - 1) / block * block), 0);
  for (std::size_t n = 0; n < count; ++n) {
    parts[2 * n] = to_q15(numbers[n].real());
    parts[2 * n + 1] = to_q15(numbers[n].imag());
  }
  return parts;
}

// The sound as the real part of complex numbers that have no negative frequencies. A tone of 300 Hz is half a turn
// of 300 Hz and half a turn of -300 Hz: moved up by 500 Hz, that is 800 Hz and 200 Hz. Without the negative half it
// is 800 Hz alone.
inline std::vector<short> analytic(const std::vector<short>& sound, std::size_t block) {
  std::size_t size = 2;
  while (size < sound.size()) size *= 2;
  std::vector<std::complex<double>> x(size);
  for (std::size_t n = 0; n < sound.size(); ++n) x[n] = sound[n];
  fourier(x);
  for (std::size_t k = 1; k < size / 2; ++k) x[k] *= 2;
  for (std::size_t k = size / 2 + 1; k < size; ++k) x[k] = 0;
  // The inverse transform by way of the forward one: conjugate, transform, conjugate, divide by the size.
  for (auto& value : x) value = std::conj(value);
  fourier(x);
  for (auto& value : x) value = std::conj(value) / static_cast<double>(size);
  return interleaved(x, sound.size(), block);
}

// Complex numbers of length 1 that turn `frequency` times a sample: 0.25 makes 1, i, -1, -i, 1, ...
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
