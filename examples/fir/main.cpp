// Filters a sound, checks every sample against plain C and draws the spectrum before and after.
#include <algorithm>
#include <string>
#include <vector>

#include "common/program.h"
#include "common/progress.h"
#include "common/spectra.h"
#include "fir/design.h"
#include "fir/fir.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;

constexpr int BLOCK = 1 << 16;  // samples between two looks of the progress bar

struct Settings {
  Pass pass;
  double cutoff, cutoff2;
  int taps;
};

Settings parse(Options& options) {
  Settings s;
  const std::string type = options.choice("type", "low", {"low", "high", "band"}, "what passes");
  s.pass = type == "low" ? Pass::low : type == "high" ? Pass::high : Pass::band;
  s.cutoff = options.number("cutoff", 1500, 1, 1e6, "the edge, or the lower edge of a band, in Hz");
  s.cutoff2 = options.number("cutoff2", 4000, 1, 1e6, "the upper edge of a band, in Hz");
  s.taps = options.integer("taps", s.pass == Pass::high ? 63 : 64, 2, FIR_MAX_TAPS, "the length of the filter");
  options.finish();
  // A symmetric filter with an even number of taps cancels what alternates from sample to sample, which is half
  // the sample rate: taps 1 1 make 0 of +1 -1 +1 -1. A high-pass must let that pass.
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

// The sound with zeros around it: in front half a filter, so that a click stays where it is in the sound, and
// behind it what the filter and the kernel's whole-register loads read beyond the end.
Samples padded(const Samples& sound, int taps) {
  Samples x(static_cast<std::size_t>((taps - 1) / 2), 0);
  x.insert(x.end(), sound.begin(), sound.end());
  x.resize(sound.size() + static_cast<std::size_t>(taps - 1 + FIR_MARGIN), 0);
  return x;
}

Samples filtered(Program& program, const Samples& sound, const Samples& taps) {
  Progress progress("filtering");
  const int tap_count = static_cast<int>(taps.size());
  const Samples x = padded(sound, tap_count);
  Samples y(sound.size() + FIR_MARGIN);
  Samples plain(sound.size());
  for (std::size_t at = 0; at < sound.size(); at += BLOCK) {
    const int count = static_cast<int>(std::min<std::size_t>(BLOCK, sound.size() - at));
    fir(&x[at], taps.data(), tap_count, &y[at], count);
    fir_reference(&x[at], taps.data(), tap_count, &plain[at], count);
    progress.show(static_cast<double>(at), static_cast<double>(sound.size()));
  }
  y.resize(sound.size());
  program.equal("samples", y, plain);
  return y;
}

// Times both on the beginning of a channel. A short one is filtered several times, so that it takes long enough.
void tell_speed(const Program& program, const Samples& sound, const Samples& taps) {
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
  program.speed("samples", static_cast<double>(count) * rounds, compare(21, run(&fir), run(&fir_reference)));
}

std::string describe(const Settings& s) {
  const std::string edge = Options::brief(s.cutoff);
  const std::string what = s.pass == Pass::low    ? "low-pass at " + edge
                           : s.pass == Pass::high ? "high-pass at " + edge
                                                  : "band-pass from " + edge + " to " + Options::brief(s.cutoff2);
  return what + " Hz, " + std::to_string(s.taps) + " taps";
}

void draw(const Program& program, const Settings& s, const Samples& taps, const Wav& before, const Wav& after) {
  Plot plot = spectra("Spectrum before and after the filter", program.input_name() + ", " + describe(s), before, after);
  plot.background("the filter alone", frequencies(SPECTRUM_POINTS, before.rate), response(taps, SPECTRUM_POINTS));
  plot.mark(s.cutoff, Options::brief(s.cutoff) + " Hz");
  if (s.pass == Pass::band) plot.mark(s.cutoff2, Options::brief(s.cutoff2) + " Hz");
  write_svg(program.picture, {plot});
}

void filter_sound(Program& program) {
  const Settings s = parse(program.options);
  const Wav before = read_wav(program.input);
  require_below_half("--cutoff", s.cutoff, before.rate);
  if (s.pass == Pass::band) require_below_half("--cutoff2", s.cutoff2, before.rate);
  const Samples taps = design(s.pass, s.cutoff / before.rate, s.cutoff2 / before.rate, s.taps);

  program.heading(describe(s), describe(before));
  Wav after = before;
  for (unsigned c = 0; c < before.channels; ++c) after.set_channel(c, filtered(program, before.channel(c), taps));
  program.checked();
  tell_speed(program, before.channel(0), taps);
  write_wav(program.output, after);
  draw(program, s, taps, before, after);
  program.written();
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run({"fir", "filters a 16-bit WAV with a windowed-sinc FIR", "guitar.wav", "fir.wav", "fir.svg"},
                       argc, argv, filter_sound);
}
