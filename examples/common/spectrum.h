// Spectra for pictures: plain double-precision arithmetic, no intrinsics.
#ifndef KASTARRI_EXAMPLES_SPECTRUM_H
#define KASTARRI_EXAMPLES_SPECTRUM_H

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>
#include <utility>
#include <vector>

namespace examples {

constexpr double PI = 3.14159265358979323846;

// The discrete Fourier transform in place; the size is a power of two.
inline void fourier(std::vector<std::complex<double>>& x) {
  const std::size_t n = x.size();
  // Each value goes to the place with the bits of its own reversed: of eight, value 3 (011) to place 6 (110).
  for (std::size_t i = 1, j = 0; i < n; ++i) {
    std::size_t bit = n >> 1;
    for (; j & bit; bit >>= 1) j ^= bit;
    j ^= bit;
    if (i < j) std::swap(x[i], x[j]);
  }
  // Transforms of two neighbours, then of four, and so on, each out of two of half its size.
  for (std::size_t span = 2; span <= n; span *= 2) {
    const std::complex<double> step = std::polar(1.0, -2 * PI / static_cast<double>(span));
    for (std::size_t start = 0; start < n; start += span) {
      std::complex<double> turn = 1;
      for (std::size_t k = start; k < start + span / 2; ++k, turn *= step) {
        const std::complex<double> odd = x[k + span / 2] * turn;
        x[k + span / 2] = x[k] - odd;
        x[k] += odd;
      }
    }
  }
}

// The mean power spectrum of a sound in dB, where 0 dB is a sine of full scale: size / 2 + 1 values from 0 Hz to
// half the sample rate. It is taken through Hann windows of `size` samples, each half over the one before; of a
// long sound at most MOST_WINDOWS are taken, at even distances.
constexpr std::size_t MOST_WINDOWS = 1000;

inline std::vector<double> power_spectrum(const std::vector<std::int16_t>& sound, std::size_t size) {
  std::vector<double> power(size / 2 + 1, 0.0);
  const std::size_t step = std::max(size / 2, sound.size() / MOST_WINDOWS);
  std::size_t windows = 0;
  for (std::size_t at = 0; at == 0 || at + size <= sound.size(); at += step, ++windows) {
    std::vector<std::complex<double>> x(size);
    for (std::size_t i = 0; i < size && at + i < sound.size(); ++i) {
      const double window = 0.5 - 0.5 * std::cos(2 * PI * static_cast<double>(i) / static_cast<double>(size));
      x[i] = sound[at + i] / 32768.0 * window;
    }
    fourier(x);
    for (std::size_t k = 0; k < power.size(); ++k) power[k] += std::norm(x[k]);
  }
  // A sine of full scale: half its amplitude at either frequency, and half of that by the window.
  const double full_scale = static_cast<double>(windows) * static_cast<double>(size * size) / 16;
  for (double& p : power) p = 10 * std::log10(p / full_scale + 1e-20);
  return power;
}

}  // namespace examples

#endif
