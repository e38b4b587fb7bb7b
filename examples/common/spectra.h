// The picture of what a kernel does to a sound: its spectrum before and after.
#ifndef KASTARRI_EXAMPLES_SPECTRA_H
#define KASTARRI_EXAMPLES_SPECTRA_H

#include <string>
#include <vector>

#include "common/spectrum.h"
#include "common/svg.h"
#include "common/wav.h"

namespace examples {

constexpr std::size_t SPECTRUM_POINTS = 2048;

// The frequencies of a spectrum of `points`, in Hz.
inline std::vector<double> frequencies(std::size_t points, double rate) {
  std::vector<double> hertz;
  for (std::size_t i = 0; i <= points / 2; ++i)
    hertz.push_back(static_cast<double>(i) * rate / static_cast<double>(points));
  return hertz;
}

// Of the first channel.
inline Plot spectra(const std::string& title, const std::string& subtitle, const Wav& before, const Wav& after) {
  Plot plot(title, subtitle);
  plot.x = {"frequency (Hz)", 0, before.rate / 2.0};
  plot.y = {"power (dB, 0 = a sine of full scale)", -140, 10};
  const std::vector<double> hertz = frequencies(SPECTRUM_POINTS, before.rate);
  plot.curve("before", hertz, power_spectrum(before.channel(0), SPECTRUM_POINTS));
  plot.curve("after", hertz, power_spectrum(after.channel(0), SPECTRUM_POINTS));
  return plot;
}

}  // namespace examples

#endif
