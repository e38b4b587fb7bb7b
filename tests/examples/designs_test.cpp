// What the examples' filters are for: which frequencies they let pass, what they do to an edge.
#include <gtest/gtest.h>

#include <cmath>

#include "biquad/design.h"
#include "convolve/filters.h"
#include "fir/design.h"
#include "mixer/analytic.h"
#include "mixer/mixer.h"

namespace {

using namespace examples;

constexpr std::size_t SIZE = 4096;

// A Hamming window leaves ripples 53 dB below what passes, and the edge lies where the gain is a half.
TEST(Designs, FirPassesWhatItShould) {
  const auto gain = [](const std::vector<short>& taps, double f) {
    return response(taps, SIZE)[static_cast<std::size_t>(f * SIZE)];
  };
  const std::vector<short> low = design(Pass::low, 0.125, 0, 128), high = design(Pass::high, 0.125, 0, 127);
  const std::vector<short> band = design(Pass::band, 0.125, 0.25, 128);
  for (const double f : {0.0, 0.05, 0.1}) {
    EXPECT_NEAR(gain(low, f), 0, 0.05) << f;
    EXPECT_LT(std::max(gain(high, f), gain(band, f)), -50) << f;
  }
  for (const double f : {0.3, 0.4, 0.5}) {
    EXPECT_NEAR(gain(high, f), 0, 0.05) << f;
    EXPECT_LT(std::max(gain(low, f), gain(band, f)), -50) << f;
  }
  EXPECT_NEAR(gain(band, 0.1875), 0, 0.05);
  for (const auto& taps : {low, high, band}) EXPECT_NEAR(gain(taps, 0.125), -6.02, 0.1);
}

TEST(Designs, BiquadsHaveTheirGains) {
  const auto gain = [](const Section& section, std::size_t at) { return response({section}, SIZE)[at]; };
  const Section bass = shelf(0.01, -6, 1), middle = peak(0.05, 9, 1), treble = shelf(0.2, 4, -1);
  EXPECT_NEAR(gain(bass, 0), -6, 0.01);
  EXPECT_NEAR(gain(bass, 41), -3, 0.1);
  EXPECT_NEAR(gain(bass, SIZE / 2), 0, 0.01);
  EXPECT_NEAR(gain(middle, 205), 9, 0.01);
  EXPECT_NEAR(gain(middle, 0), 0, 0.01);
  EXPECT_NEAR(gain(treble, SIZE / 2), 4, 0.01);
  EXPECT_NEAR(gain(treble, 0), 0, 0.01);
}

TEST(Designs, MixerMovesATone) {
  const auto wave = [](int turns, std::size_t n) {
    return 10000 * std::cos(2 * PI * turns * static_cast<double>(n) / SIZE);
  };
  std::vector<short> tone(SIZE);
  for (std::size_t n = 0; n < SIZE; ++n) tone[n] = to_q15(wave(300, n));
  const std::vector<short> x = analytic(tone, MIXER_BLOCK), w = carrier(500.0 / SIZE, SIZE, MIXER_BLOCK);
  std::vector<short> y(x.size());
  mix(x.data(), w.data(), y.data(), SIZE);
  for (std::size_t n = 0; n < SIZE; ++n) ASSERT_NEAR(y[2 * n], wave(800, n), 4) << n;
}

TEST(Designs, MasksFindAndSoftenAnEdge) {
  Picture halves(100, 5);
  for (int y = 0; y < halves.height; ++y) std::fill_n(halves.row(y) + 50, 50, 200);
  const auto middle_row = [&](const Filter& filter) {
    Convolved result(halves.width, halves.height);
    result.make(&convolve, Framed(halves), filter);
    const Picture picture = result.picture();
    return Bytes(picture.row(2) + 46, picture.row(2) + 54);
  };
  EXPECT_EQ(middle_row(sobel()), (Bytes{0, 0, 0, 200, 200, 0, 0, 0}));
  // Sums of 1 4 6 4 1, sixteenths of 200.
  EXPECT_EQ(middle_row(gauss()), (Bytes{0, 0, 13, 63, 138, 188, 200, 200}));
}

}  // namespace
