// Turns, windows and what the transform of a sound tells of it.
#ifndef KASTARRI_EXAMPLES_FFT_DESIGN_H
#define KASTARRI_EXAMPLES_FFT_DESIGN_H

#include <algorithm>
#include <cmath>
#include <complex>
#include <vector>

#include "common/pgm.h"
#include "common/spectrum.h"
#include "common/wav.h"
#include "fft/fft.h"

namespace examples {

// e^(-2 pi i k / 1024), real and imaginary parts by turns.
inline std::vector<short> turns() {
  std::vector<short> parts;
  for (int k = 0; k < FFT_SIZE / 2; ++k) {
    const std::complex<double> turn = std::polar(static_cast<double>(1 << TURN_BITS), -2 * PI * k / FFT_SIZE);
    parts.push_back(static_cast<short>(std::lround(turn.real())));
    parts.push_back(static_cast<short>(std::lround(turn.imag())));
  }
  return parts;
}

// 1,024 frames of a sound about frame `middle` under a Hann window, with silence before and behind it: as complex
// numbers, the left channel the real part and the right one, if there is one, the imaginary part.
inline std::vector<short> windowed(const Wav& sound, std::size_t middle) {
  std::vector<short> numbers(2 * FFT_SIZE, 0);
  for (std::size_t n = 0; n < FFT_SIZE; ++n) {
    const std::size_t frame = middle + n - FFT_SIZE / 2;  // before the beginning it wraps, to far behind the end
    if (frame >= sound.frames()) continue;
    const double window = 0.5 - 0.5 * std::cos(2 * PI * static_cast<double>(n) / FFT_SIZE);
    for (std::size_t c = 0; c < sound.channels; ++c)
      numbers[2 * n + c] = static_cast<short>(std::lround(sound.samples[frame * sound.channels + c] * window));
  }
  return numbers;
}

// Of the transform of left + i * right: the mean power of both at frequency k, in dB, where 0 dB is a sine of full
// scale. |left|^2 + |right|^2 at k is half of |y[k]|^2 + |y[-k]|^2: what the two have in common cancels.
inline double decibels(const std::vector<short>& y, int exponent, unsigned channels, std::size_t k) {
  const auto power = [&](std::size_t at) { return std::norm(std::complex<double>(y[2 * at], y[2 * at + 1])); };
  const double sum = (power(k) + power((FFT_SIZE - k) % FFT_SIZE)) / 2 * std::exp2(2 * exponent);
  const double full_scale = 32768.0 * 32768 * FFT_SIZE * FFT_SIZE / 16;  // through the window
  return 10 * std::log10(sum / channels / full_scale + 1e-20);
}

// How strong the signal is, and how strong what 16 bits have added to it: the transform in doubles and the difference.
struct Noise {
  double signal = 0, noise = 0;
  void add(const std::vector<short>& x, const std::vector<short>& y, int exponent) {
    std::vector<std::complex<double>> exact;
    for (std::size_t n = 0; n < FFT_SIZE; ++n) exact.emplace_back(x[2 * n], x[2 * n + 1]);
    fourier(exact);
    for (std::size_t k = 0; k < FFT_SIZE; ++k) {
      const std::complex<double> got(y[2 * k], y[2 * k + 1]);
      signal += std::norm(exact[k]);
      noise += std::norm(got * std::exp2(exponent) - exact[k]);
    }
  }
  double ratio() const { return 10 * std::log10(signal / noise); }
};

}  // namespace examples

#endif
