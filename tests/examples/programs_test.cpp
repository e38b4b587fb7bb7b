// The programs as a person runs them: what they do to sounds and pictures of which one knows what must come out.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>

#include "common/pgm.h"
#include "common/spectrum.h"
#include "common/wav.h"
#include "support.h"

namespace {

using namespace examples;
using Samples = std::vector<std::int16_t>;

// A filter's delay is taken back: a click stays where it is.
TEST(Programs, FirKeepsSoundsWhereTheyAre) {
  const Directory directory;
  Wav click{8000, 1, Samples(100, 0)};
  click.samples[40] = 20000;
  write_wav(directory.file("click.wav"), click);
  ASSERT_EQ(run_example(directory, "fir", "--input click.wav --taps 63"), "0: ");
  const Samples after = read_wav(directory.file("fir.wav")).samples;
  EXPECT_EQ(std::max_element(after.begin(), after.end()) - after.begin(), 40);
  EXPECT_EQ(directory.names(), (std::set<std::string>{"click.wav", "fir.wav", "fir.svg"}));
}

// Two tones of -30 dB, one a channel: the mean power of the channels is 3 dB less, which is 67 of the 90 dB that greys
// stand for. Frequency 128 lies 128 rows above the lowest.
TEST(Programs, FftFindsTheTonesOfBothChannels) {
  const Directory directory;
  Wav tones{8000, 2, Samples(2 * 8000)};
  for (std::size_t n = 0; n < tones.samples.size(); ++n) {
    const double turns = static_cast<double>(n / 2) * (n % 2 == 0 ? 1000 : 3000) / 8000;
    tones.samples[n] = static_cast<std::int16_t>(std::lround(1036 * std::cos(2 * PI * turns)));
  }
  write_wav(directory.file("tones.wav"), tones);
  ASSERT_EQ(run_example(directory, "fft", "--input tones.wav --top 4000 --hop 500"), "0: ");
  const Picture picture = read_pgm(directory.file("fft.pgm"));
  EXPECT_EQ(describe(picture), "16 x 512 pixels");
  for (int row = 0; row < picture.height; ++row) {
    const int away = std::min(std::abs(511 - row - 128), std::abs(511 - row - 384));
    const int grey = picture.row(row)[8];
    ASSERT_TRUE(away == 0 ? grey >= 189 && grey <= 191 : away <= 4 || grey < 60) << "row " << row << ": " << grey;
  }
}

// Without gains every section is 1 but for rounding: the pieces of the sound are back in their places.
TEST(Programs, BiquadWithoutGainsChangesNothing) {
  const Directory directory;
  ASSERT_EQ(run_example(directory, "biquad", "--bass 0 --middle 0 --treble 0"), "0: ");
  const Wav before = read_wav(EXAMPLE_DATA "/guitar.wav"), after = read_wav(directory.file("biquad.wav"));
  ASSERT_EQ(after.samples.size(), before.samples.size());
  for (std::size_t i = 0; i < before.samples.size(); ++i) ASSERT_NEAR(after.samples[i], before.samples[i], 2) << i;
}

// The root of a quarter is a half; 255 (1 / 255)^(1/2) is 15.97, and 255 (254 / 255)^(1/2) is 254.5. Two greys are
// parted midway between them.
TEST(Programs, ChangePixelsAsCalculated) {
  const Directory directory;
  const auto made = [&](const Bytes& pixels, const std::string& example, const std::string& options) {
    Picture picture(static_cast<int>(pixels.size()), 1);
    picture.pixels = pixels;
    write_pgm(directory.file("in.pgm"), picture);
    EXPECT_EQ(run_example(directory, example, "--input in.pgm --output out.pgm " + options), "0: ");
    return read_pgm(directory.file("out.pgm")).pixels;
  };
  EXPECT_EQ(made({0, 255, 64, 1, 254}, "histogram", "--gamma 2"), (Bytes{0, 255, 128, 16, 254}));
  EXPECT_EQ(made({90, 110, 90, 90, 110}, "threshold", ""), (Bytes{0, 255, 0, 0, 255}));
}

// One line that says why, and no file.
TEST(Programs, RefuseWhatTheyCannotDo) {
  const Directory directory;
  write_wav(directory.file("good.wav"), Wav{8000, 1, Samples(100, 1000)});
  const std::set<std::string> names = directory.names();
  const std::tuple<const char*, const char*, const char*> cases[] = {
      {"fir", "--input none.wav", "none.wav: No such file"},
      {"fir", "--input good.wav --volume 11", "unknown option --volume"},
      {"fir", "--input good.wav --cutoff 4000", "below half the sample rate, 4000 Hz"},
      {"fir", "--input good.wav --type high --taps 16", "--taps must be odd"},
      {"fir", "--input good.wav --output none/o.wav", "none/o.wav: No such file"},
      {"mixer", "--input good.wav --shift -4000", "within half the sample rate, 4000 Hz"},
      {"fft", "--input good.wav --hop 0", "between 32 and 1024"},
      {"biquad", "--input good.wav", "sample rate of at least 10000 Hz"},
      {"convolve", "--input good.wav", "not a binary PGM"},
  };
  for (const auto& [example, options, why] : cases) {
    const std::string told = run_example(directory, example, options);
    EXPECT_EQ(told.find(std::string("2: ") + example + ": "), 0u) << told;
    EXPECT_NE(told.find(why), std::string::npos) << told;
    EXPECT_EQ(told.find('\n'), told.size() - 1) << "one line: " << told;
    EXPECT_EQ(directory.names(), names) << options;
  }
}

}  // namespace
