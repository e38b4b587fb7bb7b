// The mixer: its kernel, and what it does to a tone.
#include <gtest/gtest.h>

#include <cmath>
#include <random>

#include "mixer/analytic.h"
#include "mixer/mixer.h"

namespace {

using namespace examples;

TEST(Mixer, KernelMultipliesAndSaturates) {
  std::mt19937 random(3);
  std::vector<short> x(4 * 2 * MIXER_BLOCK), w(x.size()), y(x.size());
  for (auto* parts : {&x, &w})
    for (auto& part : *parts) part = static_cast<short>(random());
  x[0] = x[1] = w[0] = w[1] = -32768;
  mix(x.data(), w.data(), y.data(), static_cast<int>(x.size() / 2));
  for (std::size_t n = 0; n < x.size(); n += 2) {
    // Products of 16-bit numbers are exact in a double.
    const std::complex<double> product = std::complex<double>(x[n], x[n + 1]) * std::complex<double>(w[n], w[n + 1]);
    EXPECT_EQ(y[n], to_q15(std::floor(product.real() / 32768 + 0.5))) << n;
    EXPECT_EQ(y[n + 1], to_q15(std::floor(product.imag() / 32768 + 0.5))) << n;
  }
}

TEST(Mixer, MovesATone) {
  constexpr std::size_t size = 4096;
  std::vector<short> tone(size);
  for (std::size_t n = 0; n < size; ++n)
    tone[n] = to_q15(10000 * std::cos(2 * PI * 300 * static_cast<double>(n) / size));
  const std::vector<short> x = analytic(tone, MIXER_BLOCK), w = carrier(500.0 / size, size, MIXER_BLOCK);
  std::vector<short> y(x.size());
  mix(x.data(), w.data(), y.data(), static_cast<int>(size));
  for (std::size_t n = 0; n < size; ++n)
    ASSERT_NEAR(y[2 * n], 10000 * std::cos(2 * PI * 800 * static_cast<double>(n) / size), 4) << n;
}

}  // namespace
