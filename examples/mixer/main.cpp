// Moves all frequencies of a sound by the same amount, by complex multiplication with the core's
// intrinsics; checks every sample against plain scalar code, tells how fast both are and draws the
// spectrum before and after.
#include <kastarri.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <string>
#include <vector>

#include "common/options.h"
#include "common/spectrum.h"
#include "common/svg.h"
#include "common/timing.h"
#include "common/wav.h"
#include "mixer/analytic.h"
#include "mixer/mixer.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;

constexpr int TIMED = 1 << 14;        // numbers of a timed run: they stay in the cache
constexpr std::size_t POINTS = 2048;  // of a spectrum

struct Settings {
  std::string input, output, picture;
  double shift;
};

Settings parse(int argc, char** argv) {
  Options options(argc, argv, "moves all frequencies of a 16-bit WAV");
  Settings s;
  s.input = options.path("input", EXAMPLE_DATA "/guitar.wav", "the sound: 16-bit PCM, mono or stereo");
  s.output = options.path("output", "mixer.wav", "where the moved sound goes");
  s.picture = options.path("picture", "mixer.svg", "where the picture of the spectrum goes");
  s.shift = options.number("shift", 2000, -1e5, 1e5, "how far frequencies move, in Hz; down when negative");
  options.finish();
  return s;
}

// Moves a channel and checks it. Throws if a single part of a number differs from the scalar version.
Samples moved(const Samples& sound, const Samples& w) {
  const Samples x = analytic(sound, MIXER_BLOCK);
  Samples y(x.size()), expected(x.size());
  mix(x.data(), w.data(), y.data(), static_cast<int>(x.size() / 2));
  mix_reference(x.data(), w.data(), expected.data(), static_cast<int>(x.size() / 2));
  const auto differ = std::mismatch(y.begin(), y.end(), expected.begin());
  if (differ.first != y.end()) {
    throw std::runtime_error("number " + std::to_string((differ.first - y.begin()) / 2) + " has a part of " +
                             std::to_string(*differ.first) + ", and of " + std::to_string(*differ.second) +
                             " in the scalar version");
  }
  Samples real(sound.size());
  for (std::size_t n = 0; n < real.size(); ++n) real[n] = y[2 * n];
  return real;
}

void tell_speed(const Samples& sound, const Samples& w) {
  const Samples x =
      analytic(Samples(sound.begin(),
                       sound.begin() + std::min<std::ptrdiff_t>(TIMED, static_cast<std::ptrdiff_t>(sound.size()))),
               MIXER_BLOCK);
  const int count = static_cast<int>(x.size() / 2);
  Samples y(x.size());
  const auto run = [&](auto* mixer) {
    return [&, mixer] {
      for (int i = 0; i < 8; ++i) mixer(x.data(), w.data(), y.data(), count);
    };
  };
  const Timing timing = compare(21, run(&mix), run(&mix_reference));
  const double numbers = 8e-6 * count;
  std::printf("  speed     %.1f million numbers a second, %.2f times the scalar version (%.1f)\n",
              numbers / timing.kernel, timing.ratio(), numbers / timing.scalar);
}

void draw(const Settings& s, const Wav& before, const Wav& after) {
  const std::vector<double> was = power_spectrum(before.channel(0), POINTS);
  const std::vector<double> is = power_spectrum(after.channel(0), POINTS);
  std::vector<double> kilohertz;
  for (std::size_t i = 0; i < was.size(); ++i)
    kilohertz.push_back(static_cast<double>(i * before.rate) / POINTS / 1000);
  Plot plot("Spectrum before and after", s.input.substr(s.input.find_last_of('/') + 1) + ", moved by " +
                                             Options::brief(s.shift) + " Hz, first channel");
  plot.x = {"frequency (kHz)", 0, before.rate / 2000.0};
  plot.y = {"power (dB, 0 = a sine of full scale)", -140, 10};
  plot.curve("before", kilohertz, was);
  plot.curve("after", kilohertz, is);
  write_svg(s.picture, plot);
}

int move_sound(int argc, char** argv) {
  const Settings s = parse(argc, argv);
  const Wav before = read_wav(s.input);
  if (std::fabs(s.shift) >= before.rate / 2.0)
    throw Failure("--shift must lie within half the sample rate, " + Options::brief(before.rate / 2.0) + " Hz");
  const Samples w = carrier(s.shift / before.rate, before.frames(), MIXER_BLOCK);
  Wav after = before;
  for (unsigned c = 0; c < before.channels; ++c) after.set_channel(c, moved(before.channel(c), w));

  std::printf("%s: moved by %s Hz\n", s.input.c_str(), Options::brief(s.shift).c_str());
  std::printf("  sound     %.2f s, %u Hz, %s\n", static_cast<double>(before.frames()) / before.rate, before.rate,
              before.channels == 1 ? "mono" : "stereo");
  std::printf("  target    %s\n", cstub_Km_ZNB_Orbis_R5_64k_target());
  std::printf("  check     all %zu numbers equal those of the scalar version\n", after.samples.size());
  tell_speed(before.channel(0), w);
  write_wav(s.output, after);
  draw(s, before, after);
  std::printf("  written   %s, %s\n", s.output.c_str(), s.picture.c_str());
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run("mixer", [&] { return move_sound(argc, argv); });
}
