// The filter: its design, its kernel and the program.
#include <gtest/gtest.h>

#include <cmath>
#include <random>

#include "common/wav.h"
#include "fir/design.h"
#include "fir/fir.h"
#include "support.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;

// Sums of up to 512 products of 16-bit numbers are exact in a double.
short expected_sample(const short* x, const Samples& taps) {
  double sum = 0;
  for (std::size_t k = 0; k < taps.size(); ++k) sum += static_cast<double>(x[k]) * taps[k];
  return static_cast<short>(std::min(std::max(std::floor(sum / 32768 + 0.5), -32768.0), 32767.0));
}

TEST(Fir, KernelIsExactForEveryLengthAndWritesNothingElse) {
  std::mt19937 random(7);
  for (const int tap_count : {1, 2, 16, 31, 64, FIR_MAX_TAPS}) {
    for (const int count : {1, 2, 31, 32, 33, 63, 64, 65, 200}) {
      Samples x(static_cast<std::size_t>(count + tap_count - 1 + FIR_MARGIN));
      Samples taps(static_cast<std::size_t>(tap_count));
      // Loud enough for some sums to saturate at either end, and some not.
      const unsigned shift = tap_count > 16 ? 4 : 0;
      for (auto& sample : x) sample = static_cast<short>(random());
      for (auto& tap : taps) tap = static_cast<short>(static_cast<short>(random()) >> shift);
      Samples y(static_cast<std::size_t>(count) + 40, 12345);
      fir(x.data(), taps.data(), tap_count, y.data() + 4, count);
      for (int i = -4; i < count + 36; ++i) {
        const short expected =
            i < 0 || i >= count ? short{12345} : expected_sample(&x[static_cast<std::size_t>(i)], taps);
        ASSERT_EQ(y[static_cast<std::size_t>(i + 4)], expected)
            << tap_count << " taps, " << count << " samples, at " << i;
      }
    }
  }
}

// A Hamming window leaves ripples 53 dB below what passes, and the edge lies where the gain is a half.
TEST(Fir, DesignPassesWhatItShould) {
  constexpr std::size_t size = 4096;
  const auto gain = [](const Samples& taps, double frequency) {
    return response(taps, size)[static_cast<std::size_t>(frequency * size)];
  };
  const Samples low = design(Pass::low, 0.125, 0, 128);
  const Samples high = design(Pass::high, 0.125, 0, 127);
  const Samples band = design(Pass::band, 0.125, 0.25, 128);
  for (const double f : {0.0, 0.05, 0.1}) {
    EXPECT_NEAR(gain(low, f), 0, 0.05) << f;
    EXPECT_LT(gain(high, f), -50) << f;
    EXPECT_LT(gain(band, f), -50) << f;
  }
  for (const double f : {0.3, 0.4, 0.5}) {
    EXPECT_LT(gain(low, f), -50) << f;
    EXPECT_NEAR(gain(high, f), 0, 0.05) << f;
    EXPECT_LT(gain(band, f), -50) << f;
  }
  EXPECT_NEAR(gain(band, 0.1875), 0, 0.05);
  for (const Samples& taps : {low, high, band}) EXPECT_NEAR(gain(taps, 0.125), -6.02, 0.1);
}

TEST(Fir, ProgramFiltersTheRecording) {
  const Directory directory;
  const Outcome run = run_example(directory, "fir", "--type high --cutoff 8000 --output o.wav --picture p.svg");
  EXPECT_EQ(run.status, 0) << run.errors;
  EXPECT_EQ(run.errors, "");
  EXPECT_EQ(directory.names(), (std::set<std::string>{"o.wav", "p.svg"}));

  const Wav before = read_wav(EXAMPLE_DATA "/guitar.wav");
  const Wav after = read_wav(directory.file("o.wav"));
  EXPECT_EQ(after.rate, before.rate);
  ASSERT_EQ(after.samples.size(), before.samples.size());
  // Nearly all of a guitar lies below 8 kHz.
  double energy_before = 0, energy_after = 0;
  for (std::size_t i = 0; i < before.samples.size(); ++i) {
    energy_before += std::pow(before.samples[i], 2);
    energy_after += std::pow(after.samples[i], 2);
  }
  EXPECT_LT(energy_after, energy_before * 1e-4);
  EXPECT_GT(energy_after, 0);
}

TEST(Fir, ProgramKeepsSoundsWhereTheyAre) {
  const Directory directory;
  Wav click{8000, 1, Samples(100, 0)};
  click.samples[40] = 20000;
  write_wav(directory.file("click.wav"), click);
  const Outcome run = run_example(directory, "fir", "--input click.wav --taps 63");
  EXPECT_EQ(run.status, 0) << run.errors;
  const Samples after = read_wav(directory.file("fir.wav")).samples;
  EXPECT_EQ(std::max_element(after.begin(), after.end()) - after.begin(), 40);
}

TEST(Fir, ProgramRefusesWhatItCannotDo) {
  const Directory directory;
  write_file(directory.file("text.wav"), "Not a sound at all, but long enough for one.");
  write_wav(directory.file("good.wav"), Wav{8000, 1, Samples(100, 1000)});
  Bytes cut = read_file(directory.file("good.wav"));
  cut.pop_back();
  write_file(directory.file("cut.wav"), cut);
  cut[20] = 2;
  write_file(directory.file("adpcm.wav"), cut);
  const std::set<std::string> names = directory.names();

  const std::pair<const char*, const char*> cases[] = {
      {"--input none.wav", "none.wav: No such file"},
      {"--input text.wav", "not a WAV file"},
      {"--input cut.wav", "truncated"},
      {"--input adpcm.wav", "compressed"},
      {"--input good.wav --volume 11", "unknown option --volume"},
      {"--input good.wav --cutoff 4000", "below half the sample rate, 4000 Hz"},
      {"--input good.wav --type band --cutoff 900 --cutoff2 800", "--cutoff2 must lie above --cutoff"},
      {"--input good.wav --type high --taps 16", "--taps must be odd"},
      {"--input good.wav --output none/o.wav", "none/o.wav: No such file"},
      {"--input good.wav --output /dev/full", "No space left"},
  };
  for (const auto& one : cases) {
    const Outcome run = run_example(directory, "fir", one.first);
    EXPECT_EQ(run.status, 2) << one.first;
    EXPECT_NE(run.errors.find(one.second), std::string::npos) << one.first << ": " << run.errors;
    EXPECT_EQ(run.errors.find('\n'), run.errors.size() - 1) << "one line: " << run.errors;
    EXPECT_EQ(directory.names(), names) << one.first;
  }
}

}  // namespace
