// The equaliser: its design, its kernels and the program.
#include <gtest/gtest.h>

#include <cmath>
#include <random>

#include "biquad/biquad.h"
#include "biquad/design.h"
#include "common/wav.h"
#include "support.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;

const std::vector<Section> SECTIONS = {shelf(0.01, -6, 1), peak(0.05, 9, 1), shelf(0.2, 4, -1)};

TEST(Biquad, DesignHasItsGains) {
  const auto gain = [](const Section& s, std::size_t at) { return response({s}, 4096)[at]; };
  EXPECT_NEAR(gain(SECTIONS[0], 0), -6, 0.01);
  EXPECT_NEAR(gain(SECTIONS[0], 2048), 0, 0.01);
  EXPECT_NEAR(gain(SECTIONS[0], 41), -3, 0.1);
  EXPECT_NEAR(gain(SECTIONS[1], 205), 9, 0.01);
  EXPECT_NEAR(gain(SECTIONS[1], 0), 0, 0.01);
  EXPECT_NEAR(gain(SECTIONS[2], 2048), 4, 0.01);
  EXPECT_NEAR(gain(SECTIONS[2], 0), 0, 0.01);
}

// Each lane is a sound of its own, loud enough to saturate here and there.
TEST(Biquad, SinglePrecisionEqualsPlainCode) {
  constexpr int frames = 500;
  std::mt19937 random(3);
  Samples x(frames * SINGLE_LANES), y(x.size()), lane(frames), expected(frames);
  for (auto& sample : x) sample = static_cast<short>(random());
  biquad_single(SECTIONS.data(), 3, x.data(), y.data(), frames);
  for (std::size_t l = 0; l < SINGLE_LANES; ++l) {
    for (std::size_t f = 0; f < frames; ++f) lane[f] = x[f * SINGLE_LANES + l];
    biquad_reference(SECTIONS.data(), 3, lane.data(), expected.data(), frames);
    for (std::size_t f = 0; f < frames; ++f) ASSERT_EQ(y[f * SINGLE_LANES + l], expected[f]) << l << ' ' << f;
  }
}

// A half has 11 bits: about 60 dB for each operation, less what the poles make of it.
TEST(Biquad, HalfPrecisionIsNear) {
  constexpr int frames = 500;
  Samples x(frames * HALF_LANES), y(x.size()), lane(frames), expected(frames);
  for (std::size_t f = 0; f < frames; ++f) {
    lane[f] = static_cast<short>(8000 * std::sin(static_cast<double>(f) / 7));
    for (std::size_t l = 0; l < HALF_LANES; ++l) x[f * HALF_LANES + l] = lane[f];
  }
  biquad_half(SECTIONS.data(), 3, x.data(), y.data(), frames);
  biquad_reference(SECTIONS.data(), 3, lane.data(), expected.data(), frames);
  double power = 0, noise = 0;
  for (std::size_t f = 0; f < frames; ++f) {
    for (std::size_t l = 1; l < HALF_LANES; ++l) ASSERT_EQ(y[f * HALF_LANES + l], y[f * HALF_LANES]);
    power += std::pow(expected[f], 2);
    noise += std::pow(expected[f] - y[f * HALF_LANES], 2);
  }
  EXPECT_GT(10 * std::log10(power / noise), 25);
  EXPECT_GT(noise, 0);
}

TEST(Biquad, ProgramEqualisesTheRecording) {
  const Directory directory;
  const Outcome run = run_example(directory, "biquad", "--bass 0 --middle 0 --treble 0 --output o.wav --picture p.svg");
  EXPECT_EQ(run.status, 0) << run.errors;
  EXPECT_EQ(run.errors, "");
  EXPECT_EQ(directory.names(), (std::set<std::string>{"o.wav", "p.svg"}));
  // Without gains every section is 1 but for rounding.
  const Wav before = read_wav(EXAMPLE_DATA "/guitar.wav"), after = read_wav(directory.file("o.wav"));
  ASSERT_EQ(after.samples.size(), before.samples.size());
  for (std::size_t i = 0; i < before.samples.size(); ++i) ASSERT_NEAR(after.samples[i], before.samples[i], 2) << i;
}

TEST(Biquad, ProgramRefusesWhatItCannotDo) {
  const Directory directory;
  write_wav(directory.file("slow.wav"), Wav{8000, 1, Samples(100, 1000)});
  const Outcome run = run_example(directory, "biquad", "--input slow.wav");
  EXPECT_EQ(run.status, 2);
  EXPECT_NE(run.errors.find("sample rate of at least 10000 Hz"), std::string::npos) << run.errors;
}

}  // namespace
