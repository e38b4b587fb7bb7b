// The kernels of the examples, on noise, against what doubles or plain C make of it: for lengths about whole
// registers, with room around the results in which nothing may be written.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>

#include "biquad/biquad.h"
#include "biquad/design.h"
#include "convolve/filters.h"
#include "fft/design.h"
#include "fir/fir.h"
#include "histogram/histogram.h"
#include "mixer/analytic.h"
#include "mixer/mixer.h"
#include "threshold/threshold.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;

template <class T>
std::vector<T> noise(std::size_t count) {
  static std::mt19937 random(7);
  std::vector<T> values(count);
  for (auto& value : values) value = static_cast<T>(random());
  return values;
}

// A sum of products of two Q15 numbers, which doubles hold exactly: back to Q15, rounded half up, saturated.
short q15(double sum) { return to_q15(std::floor(sum / 32768 + 0.5)); }

TEST(Kernels, Fir) {
  constexpr std::size_t room = 4;
  for (const std::size_t tap_count : {1, 2, 16, 31, 64, FIR_MAX_TAPS}) {
    for (const std::size_t count : {1, 2, 31, 32, 33, 64, 200}) {
      const Samples x = noise<short>(count + tap_count - 1 + FIR_MARGIN);
      Samples taps = noise<short>(tap_count);
      // Loud enough for some sums to saturate at either end, and some not.
      for (auto& tap : taps) tap = static_cast<short>(tap_count > 16 ? tap >> 4 : tap);
      Samples y(room + count + FIR_MARGIN, 12345), expected = y;
      for (std::size_t n = 0; n < count; ++n) {
        double sum = 0;
        for (std::size_t k = 0; k < tap_count; ++k) sum += static_cast<double>(x[n + k]) * taps[k];
        expected[room + n] = q15(sum);
      }
      fir(x.data(), taps.data(), static_cast<int>(tap_count), &y[room], static_cast<int>(count));
      ASSERT_EQ(y, expected) << tap_count << " taps, " << count << " samples";
    }
  }
}

TEST(Kernels, Mixer) {
  Samples x = noise<short>(4 * 2 * MIXER_BLOCK), w = noise<short>(x.size()), y(x.size());
  x[0] = x[1] = w[0] = w[1] = -32768;
  mix(x.data(), w.data(), y.data(), static_cast<int>(x.size() / 2));
  for (std::size_t n = 0; n < x.size(); n += 2) {
    const std::complex<double> product = std::complex<double>(x[n], x[n + 1]) * std::complex<double>(w[n], w[n + 1]);
    EXPECT_EQ(y[n], q15(product.real())) << n;
    EXPECT_EQ(y[n + 1], q15(product.imag())) << n;
  }
}

// Of whatever size the numbers are, what ten stages of 16 bits add stays far below them: an overflow, a wrong turn or a
// wrong exponent would be as loud as they are. The last ones have the largest part that there is.
TEST(Kernels, Fft) {
  constexpr std::size_t room = 4;
  const Samples table = turns();
  for (int quieter = 0; quieter < 18; ++quieter) {
    Samples x = noise<short>(2 * FFT_SIZE), y(room + x.size() + room, 12345), plain(x.size());
    for (auto& part : x) part = static_cast<short>(quieter == 17 ? -32768 : part >> quieter);
    const int exponent = fft(x.data(), table.data(), &y[room]);
    ASSERT_EQ(exponent, fft_reference(x.data(), table.data(), plain.data()));
    ASSERT_EQ(Samples(y.begin() + room, y.end() - room), plain) << quieter;
    for (std::size_t i = 0; i < room; ++i) ASSERT_EQ(y[i] + y[y.size() - 1 - i], 2 * 12345);
    Noise noise;
    noise.add(x, plain, exponent);
    EXPECT_GT(noise.ratio(), 58) << quieter;
  }
  Samples silence(2 * FFT_SIZE, 0), y(2 * FFT_SIZE, 1);
  EXPECT_EQ(fft(silence.data(), table.data(), y.data()), 0);
  EXPECT_EQ(y, silence);
}

// Each lane is a sound of its own, loud enough to saturate here and there.
TEST(Kernels, Biquad) {
  const std::vector<Section> sections = {shelf(0.01, -6, 1), peak(0.05, 9, 1), shelf(0.2, 4, -1)};
  const auto check = [&](auto kernel, auto plain, std::size_t lanes) {
    constexpr int frames = 500;
    const Samples x = noise<short>(frames * lanes);
    Samples y(x.size()), lane(frames), expected(frames);
    kernel(sections.data(), 3, x.data(), y.data(), frames);
    for (std::size_t l = 0; l < lanes; ++l) {
      for (std::size_t f = 0; f < frames; ++f) lane[f] = x[f * lanes + l];
      plain(sections.data(), 3, lane.data(), expected.data(), frames);
      for (std::size_t f = 0; f < frames; ++f) ASSERT_EQ(y[f * lanes + l], expected[f]) << l << ' ' << f;
    }
  };
  check(biquad_single, biquad_single_reference, SINGLE_LANES);
  check(biquad_half, biquad_half_reference, HALF_LANES);
}

// Pixels beyond the edge are the nearest ones inside.
TEST(Kernels, Convolve) {
  for (const int width : {1, 2, 63, 64, 65, 130}) {
    Picture picture(width, 7);
    picture.pixels = noise<std::uint8_t>(picture.pixels.size());
    Filter filter{std::vector<Mask>(2), MASK_RADIUS, 4};
    for (auto& mask : filter.masks)
      for (auto& row : mask.weight)
        for (auto& weight : row) weight = noise<signed char>(1)[0];
    Convolved got(width, picture.height);
    got.make(&convolve, Framed(picture), filter);
    for (int at = 0; at < width * picture.height; ++at) {
      const int x = at % width, y = at / width;
      double most = 0;
      for (const Mask& mask : filter.masks) {
        double sum = 0;
        for (int i = 0; i < MASK_SIZE; ++i)
          for (int j = 0; j < MASK_SIZE; ++j)
            sum += mask.weight[i][j] *
                   picture.row(std::clamp(y + i - MASK_RADIUS, 0,
                                          picture.height - 1))[std::clamp(x + j - MASK_RADIUS, 0, width - 1)];
        most = std::max(most, std::floor(sum / 16 + 0.5));
      }
      ASSERT_EQ(got.picture().row(y)[x], std::min(most, 255.0)) << width << " wide, at " << x << ", " << y;
    }
  }
}

// Every level, with white behind the last pixel, which must not count.
TEST(Kernels, Threshold) {
  for (const std::size_t count : {1, 63, 64, 65, 300}) {
    Bytes pixels = noise<std::uint8_t>(count), parted(count + THRESHOLD_MARGIN);
    pixels.resize(count + THRESHOLD_MARGIN, 255);
    for (int level = -1; level <= 255; ++level) {
      const int shift = (level + 1) % 8;
      part(pixels.data(), parted.data(), static_cast<int>(count), std::max(level, 0), shift);
      Part expected;
      for (std::size_t i = 0; i < count; ++i) {
        const bool light = pixels[i] > level;
        if (light) ++expected.pixels, expected.sum += pixels[i];
        const int moved = pixels[i] + ((light ? 255 : 0) - pixels[i]) / (1 << shift);
        ASSERT_EQ(parted[i], level < 0 ? parted[i] : moved) << "level " << level << ", shift " << shift;
      }
      const Part got = lighter(pixels.data(), static_cast<int>(count), level);
      ASSERT_EQ(got.pixels, expected.pixels) << count << " pixels, level " << level;
      ASSERT_EQ(got.sum, expected.sum) << count << " pixels, level " << level;
    }
  }
}

TEST(Kernels, HistogramAndLookUp) {
  constexpr std::size_t room = 4;
  const Bytes table = noise<unsigned char>(GREYS + 1);
  // The long ones have more pixels of one grey than 16 bits count.
  for (const std::size_t count : {1, 2, 31, 32, 33, 64, 1000, 65503, 65504, 65505, 200001}) {
    Bytes pixels = noise<unsigned char>(count + PIXEL_MARGIN);
    if (count > 65000) std::fill_n(pixels.begin(), count - 900, static_cast<unsigned char>(77));
    std::vector<unsigned> counts(GREYS, 9), expected(GREYS);
    Bytes out(room + pixels.size(), 0xA5), looked_up = out;
    for (std::size_t i = 0; i < count; ++i) ++expected[pixels[i]], looked_up[room + i] = table[pixels[i]];
    count_greys(pixels.data(), static_cast<int>(count), counts.data());
    ASSERT_EQ(counts, expected) << count;
    look_up(pixels.data(), static_cast<int>(count), table.data(), &out[room]);
    ASSERT_EQ(out, looked_up) << count;
  }
}

}  // namespace
