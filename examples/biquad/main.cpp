// Equalises a sound in single and in half precision, checks the single one against plain scalar code, tells
// how much noise half precision adds and draws what both do to each frequency.
#include <kastarri.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <string>
#include <vector>

#include "biquad/biquad.h"
#include "biquad/design.h"
#include "common/options.h"
#include "common/spectrum.h"
#include "common/svg.h"
#include "common/timing.h"
#include "common/wav.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;
using Kernel = void (*)(const Section*, int, const short*, short*, int);

constexpr std::size_t POINTS = 4096;  // of a response
constexpr int RUN_IN = 8192;          // samples after which a lane has forgotten how it began

struct Settings {
  std::string input, output, picture;
  double bass, middle, treble;
};

Settings parse(int argc, char** argv) {
  Options options(argc, argv, "equalises a 16-bit WAV in single and in half precision");
  Settings s;
  s.input = options.path("input", EXAMPLE_DATA "/guitar.wav", "the sound: 16-bit PCM, mono or stereo");
  s.output = options.path("output", "biquad.wav", "where the equalised sound goes (single precision)");
  s.picture = options.path("picture", "biquad.svg", "where the picture of the responses goes");
  s.bass = options.number("bass", -4, -12, 12, "dB below 300 Hz");
  s.middle = options.number("middle", -6, -12, 12, "dB about 1 kHz");
  s.treble = options.number("treble", 3, -12, 12, "dB above 4 kHz");
  options.finish();
  return s;
}

std::vector<Section> equaliser(const Settings& s, double rate) {
  if (rate < 10000) throw Failure(s.input + ": the equaliser needs a sample rate of at least 10000 Hz");
  return {shelf(300 / rate, s.bass, 1), peak(1000 / rate, s.middle, 1), shelf(4000 / rate, s.treble, -1)};
}

int count_of(const std::vector<Section>& sections) { return static_cast<int>(sections.size()); }

// A sound in as many pieces as the kernel has lanes. Each lane starts RUN_IN samples before its piece,
// and what it makes of those is dropped.
Samples in_lanes(Kernel kernel, int lanes, const std::vector<Section>& sections, const Samples& sound) {
  const std::size_t n = static_cast<std::size_t>(lanes);
  const std::size_t piece = (sound.size() + n - 1) / n, frames = piece + RUN_IN;
  Samples x(frames * n), y(frames * n), out(sound.size());
  const auto place = [&](std::size_t frame, std::size_t lane) { return lane * piece + frame - RUN_IN; };
  for (std::size_t f = 0; f < frames; ++f)
    for (std::size_t l = 0; l < n; ++l)
      if (place(f, l) < sound.size()) x[f * n + l] = sound[place(f, l)];
  kernel(sections.data(), count_of(sections), x.data(), y.data(), static_cast<int>(frames));
  for (std::size_t f = RUN_IN; f < frames; ++f)
    for (std::size_t l = 0; l < n; ++l)
      if (place(f, l) < sound.size()) out[place(f, l)] = y[f * n + l];
  return out;
}

// Every lane of the single-precision kernel against the scalar version, from its own beginning.
void check_single(const std::vector<Section>& sections, const Samples& sound) {
  const std::size_t frames = sound.size() / SINGLE_LANES;
  Samples x(frames * SINGLE_LANES), y(x.size()), lane(frames), expected(frames);
  for (std::size_t i = 0; i < x.size(); ++i) x[i] = sound[i % SINGLE_LANES * frames + i / SINGLE_LANES];
  biquad_single(sections.data(), count_of(sections), x.data(), y.data(), static_cast<int>(frames));
  for (std::size_t l = 0; l < SINGLE_LANES; ++l) {
    for (std::size_t f = 0; f < frames; ++f) lane[f] = sound[l * frames + f];
    biquad_reference(sections.data(), count_of(sections), lane.data(), expected.data(), static_cast<int>(frames));
    for (std::size_t f = 0; f < frames; ++f) {
      if (y[f * SINGLE_LANES + l] != expected[f])
        throw std::runtime_error("lane " + std::to_string(l) + ", sample " + std::to_string(f) + " is " +
                                 std::to_string(y[f * SINGLE_LANES + l]) + ", and " + std::to_string(expected[f]) +
                                 " in the scalar version");
    }
  }
}

// The power of the signal over that of the difference, in dB.
double signal_to_noise(const Samples& signal, const Samples& other) {
  double power = 0, noise = 0;
  for (std::size_t i = 0; i < signal.size(); ++i) {
    power += std::pow(signal[i], 2);
    noise += std::pow(signal[i] - other[i], 2);
  }
  return 10 * std::log10((power + 1e-20) / (noise + 1e-20));
}

// What a kernel makes of an impulse, as gains in dB.
std::vector<double> measured(Kernel kernel, int lanes, const std::vector<Section>& sections) {
  constexpr short impulse = 16384;
  Samples x(POINTS * static_cast<std::size_t>(lanes)), y(x.size());
  x[0] = impulse;
  kernel(sections.data(), count_of(sections), x.data(), y.data(), static_cast<int>(POINTS));
  std::vector<std::complex<double>> spectrum(POINTS);
  for (std::size_t i = 0; i < POINTS; ++i)
    spectrum[i] = static_cast<double>(y[i * static_cast<std::size_t>(lanes)]) / impulse;
  fourier(spectrum);
  std::vector<double> decibels;
  for (std::size_t k = 0; k <= POINTS / 2; ++k) decibels.push_back(10 * std::log10(std::norm(spectrum[k]) + 1e-20));
  return decibels;
}

void draw(const Settings& s, const std::vector<Section>& sections, double rate) {
  std::vector<double> kilohertz;
  for (std::size_t k = 0; k <= POINTS / 2; ++k) kilohertz.push_back(static_cast<double>(k) * rate / POINTS / 1000);
  Plot plot("Response of the equaliser", "bass " + Options::brief(s.bass) + " dB, middle " + Options::brief(s.middle) +
                                             " dB, treble " + Options::brief(s.treble) + " dB; from an impulse");
  plot.x = {"frequency (kHz)", 0, std::min(rate / 2000, 12.0)};
  plot.y = {"gain (dB)", -15, 15};
  plot.background("as designed", kilohertz, response(sections, POINTS));
  plot.curve("single precision", kilohertz, measured(biquad_single, SINGLE_LANES, sections));
  plot.curve("half precision", kilohertz, measured(biquad_half, HALF_LANES, sections));
  write_svg(s.picture, plot);
}

void tell_speed(const std::vector<Section>& sections) {
  constexpr int frames = 4000;
  Samples x(frames * HALF_LANES, 1000), y(x.size());
  const auto run = [&](Kernel kernel, int of) {
    return [&, kernel, of] { kernel(sections.data(), count_of(sections), x.data(), y.data(), of); };
  };
  const auto quiet = [](int, int) {};
  const auto rate = [](int samples, double seconds) { return samples / 1e6 / seconds; };
  const Timing single = compare(9, run(biquad_single, frames), run(biquad_reference, frames * SINGLE_LANES), quiet);
  const Timing half = compare(9, run(biquad_half, frames), run(biquad_reference, frames * HALF_LANES), quiet);
  std::printf("  speed     %.1f million samples a second in single, %.1f in half precision, %.1f in scalar code\n",
              rate(frames * SINGLE_LANES, single.kernel), rate(frames * HALF_LANES, half.kernel),
              rate(frames * SINGLE_LANES, single.scalar));
}

int equalise(int argc, char** argv) {
  const Settings s = parse(argc, argv);
  const Wav before = read_wav(s.input);
  const std::vector<Section> sections = equaliser(s, before.rate);
  Wav after = before;
  double noise = 0;
  for (unsigned c = 0; c < before.channels; ++c) {
    const Samples sound = before.channel(c);
    check_single(sections, sound);
    const Samples single = in_lanes(biquad_single, SINGLE_LANES, sections, sound);
    const Samples half = in_lanes(biquad_half, HALF_LANES, sections, sound);
    noise += signal_to_noise(single, half) / before.channels;
    after.set_channel(c, single);
  }
  std::printf("%s: bass %g dB, middle %g dB, treble %g dB\n", s.input.c_str(), s.bass, s.middle, s.treble);
  std::printf("  target    %s\n", cstub_Km_ZNB_Orbis_R5_64k_target());
  std::printf("  check     every lane in single precision equals the scalar version\n");
  std::printf("  noise     signal to noise of half precision: %.1f dB\n", noise);
  tell_speed(sections);
  write_wav(s.output, after);
  draw(s, sections, before.rate);
  std::printf("  written   %s, %s\n", s.output.c_str(), s.picture.c_str());
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run("biquad", [&] { return equalise(argc, argv); });
}
