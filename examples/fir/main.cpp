// Filters a sound with the core's intrinsics, checks every sample against plain scalar code, tells how
// fast both are and draws the spectrum before and after.
#include <kastarri.h>

#include <algorithm>
#include <cstdio>
#include <string>
#include <vector>

#include "common/options.h"
#include "common/progress.h"
#include "common/spectrum.h"
#include "common/svg.h"
#include "common/timing.h"
#include "common/wav.h"
#include "fir/design.h"
#include "fir/fir.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;

constexpr int BLOCK = 1 << 16;        // samples between two looks of the progress bar
constexpr std::size_t POINTS = 2048;  // of a spectrum

struct Settings {
  std::string input, output, picture;
  Pass pass;
  double cutoff, cutoff2;
  int taps;
};

Settings parse(int argc, char** argv) {
  Options options(argc, argv, "filters a 16-bit WAV with a windowed-sinc FIR");
  Settings s;
  s.input = options.path("input", EXAMPLE_DATA "/guitar.wav", "the sound to filter: 16-bit PCM, mono or stereo");
  s.output = options.path("output", "fir.wav", "where the filtered sound goes");
  s.picture = options.path("picture", "fir.svg", "where the picture of the spectrum goes");
  const std::string type = options.choice("type", "low", {"low", "high", "band"}, "what passes");
  s.pass = type == "low" ? Pass::low : type == "high" ? Pass::high : Pass::band;
  s.cutoff = options.number("cutoff", 1500, 1, 1e6, "the edge, or the lower edge of a band, in Hz");
  s.cutoff2 = options.number("cutoff2", 4000, 1, 1e6, "the upper edge of a band, in Hz");
  s.taps = options.integer("taps", s.pass == Pass::high ? 63 : 64, 2, FIR_MAX_TAPS, "the length of the filter");
  options.finish();
  // Taps even in number and symmetric have a zero at half the sample rate, which a high-pass must pass.
  if (s.pass == Pass::high && s.taps % 2 == 0) throw Failure("--taps must be odd for a high-pass");
  if (s.pass == Pass::band && s.cutoff2 <= s.cutoff) throw Failure("--cutoff2 must lie above --cutoff");
  if (s.pass != Pass::band && options.given("cutoff2")) throw Failure("--cutoff2 is for --type band");
  return s;
}

void require_below_half(const char* option, double frequency, unsigned rate) {
  if (frequency < rate / 2.0) return;
  throw Failure(std::string(option) + " is " + Options::brief(frequency) +
                " Hz; it must lie below half the sample rate, " + Options::brief(rate / 2.0) + " Hz");
}

// The sound with silence around it: the filter's middle then stands on the sample that it makes, and the
// last loads of the kernel stay inside.
Samples padded(const Samples& sound, int taps) {
  Samples x(static_cast<std::size_t>((taps - 1) / 2), 0);
  x.insert(x.end(), sound.begin(), sound.end());
  x.resize(sound.size() + static_cast<std::size_t>(taps - 1 + FIR_MARGIN), 0);
  return x;
}

// Filters a channel and checks it. Throws if a single sample differs from the scalar version.
Samples filtered(const Samples& sound, const Samples& taps, Progress& progress, double done, double total) {
  const int tap_count = static_cast<int>(taps.size());
  const Samples x = padded(sound, tap_count);
  Samples y(sound.size() + FIR_MARGIN);
  Samples expected(sound.size());
  for (std::size_t at = 0; at < sound.size(); at += BLOCK) {
    const int count = static_cast<int>(std::min<std::size_t>(BLOCK, sound.size() - at));
    fir(&x[at], taps.data(), tap_count, &y[at], count);
    fir_reference(&x[at], taps.data(), tap_count, &expected[at], count);
    progress.show(done + static_cast<double>(at), total);
  }
  y.resize(sound.size());
  const auto differ = std::mismatch(y.begin(), y.end(), expected.begin());
  if (differ.first != y.end()) {
    throw std::runtime_error("sample " + std::to_string(differ.first - y.begin()) + " is " +
                             std::to_string(*differ.first) + ", and " + std::to_string(*differ.second) +
                             " in the scalar version");
  }
  return y;
}

// Times the kernel and the scalar version on the beginning of a channel, as often as makes a fair figure.
void tell_speed(const Samples& sound, const Samples& taps) {
  const int tap_count = static_cast<int>(taps.size());
  const int count = static_cast<int>(std::min<std::size_t>(BLOCK, sound.size()));
  const int rounds = std::max(1, BLOCK / count);
  const Samples x = padded(sound, tap_count);
  Samples y(static_cast<std::size_t>(count + FIR_MARGIN));
  const auto run = [&](auto* filter) {
    return [&, filter] {
      for (int i = 0; i < rounds; ++i) filter(x.data(), taps.data(), tap_count, y.data(), count);
    };
  };
  Progress progress("timing");
  const Timing timing = compare(21, run(&fir), run(&fir_reference), [&](int i, int of) { progress.show(i, of); });
  const double samples = static_cast<double>(count) * rounds / 1e6;
  std::printf("  speed     %.1f million samples a second, %.2f times the scalar version (%.1f)\n",
              samples / timing.kernel, timing.ratio(), samples / timing.scalar);
}

Samples mono(const Wav& wav) {
  Samples mix(wav.frames());
  for (std::size_t i = 0; i < mix.size(); ++i) {
    int sum = 0;
    for (unsigned c = 0; c < wav.channels; ++c) sum += wav.samples[i * wav.channels + c];
    mix[i] = static_cast<short>(sum / static_cast<int>(wav.channels));
  }
  return mix;
}

std::string describe(const Settings& s) {
  const std::string edge = Options::brief(s.cutoff);
  const std::string what = s.pass == Pass::low    ? "low-pass at " + edge
                           : s.pass == Pass::high ? "high-pass at " + edge
                                                  : "band-pass from " + edge + " to " + Options::brief(s.cutoff2);
  return what + " Hz, " + std::to_string(s.taps) + " taps";
}

void draw(const Settings& s, const Samples& taps, const Wav& before, const Wav& after) {
  const std::vector<double> was = power_spectrum(mono(before), POINTS);
  const std::vector<double> is = power_spectrum(mono(after), POINTS);
  std::vector<double> kilohertz;
  for (std::size_t i = 0; i < was.size(); ++i)
    kilohertz.push_back(static_cast<double>(i * before.rate) / POINTS / 1000);

  const std::string file = s.input.substr(s.input.find_last_of('/') + 1);
  Plot plot("Spectrum before and after the filter", file + ", " + describe(s));
  plot.x = {"frequency (kHz)", 0, before.rate / 2000.0};
  plot.y = {"power (dB, 0 = a sine of full scale)", -140, 10};
  plot.curve("before", kilohertz, was);
  plot.curve("after", kilohertz, is);
  plot.background("the filter alone", kilohertz, response(taps, POINTS));
  plot.mark(s.cutoff / 1000, Options::brief(s.cutoff) + " Hz");
  if (s.pass == Pass::band) plot.mark(s.cutoff2 / 1000, Options::brief(s.cutoff2) + " Hz");
  write_svg(s.picture, plot);
}

int filter_sound(int argc, char** argv) {
  const Settings s = parse(argc, argv);
  const Wav before = read_wav(s.input);
  require_below_half("--cutoff", s.cutoff, before.rate);
  if (s.pass == Pass::band) require_below_half("--cutoff2", s.cutoff2, before.rate);
  const Samples taps = design(s.pass, s.cutoff / before.rate, s.cutoff2 / before.rate, s.taps);

  Wav after = before;
  {
    Progress progress("filtering");
    const auto frames = static_cast<double>(before.frames());
    for (unsigned c = 0; c < before.channels; ++c) {
      after.set_channel(c, filtered(before.channel(c), taps, progress, c * frames, before.channels * frames));
    }
  }
  std::printf("%s: %s\n", s.input.c_str(), describe(s).c_str());
  std::printf("  sound     %.2f s, %u Hz, %s\n", static_cast<double>(before.frames()) / before.rate, before.rate,
              before.channels == 1 ? "mono" : "stereo");
  std::printf("  target    %s\n", cstub_Km_ZNB_Orbis_R5_64k_target());
  std::printf("  check     all %zu samples equal those of the scalar version\n", after.samples.size());
  tell_speed(before.channel(0), taps);
  write_wav(s.output, after);
  draw(s, taps, before, after);
  std::printf("  written   %s, %s\n", s.output.c_str(), s.picture.c_str());
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run("fir", [&] { return filter_sound(argc, argv); });
}
