// Equalises a sound in single and in half precision, checks every sample of both against plain C, tells how much
// noise half precision adds and draws what both do to each frequency.
#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "biquad/biquad.h"
#include "biquad/design.h"
#include "common/program.h"
#include "common/spectra.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;
using Cascade = void (*)(const Section*, int, const short*, short*, int);

constexpr std::size_t POINTS = 16384;  // of a response
constexpr int RUN_IN = 8192;           // samples after which a filter has forgotten how it began

// The cascade in one precision: for the core, where a register holds `lanes` sounds, and in plain C.
struct Precision {
  const char* name;
  Cascade kernel, plain;
  std::size_t lanes;
};
constexpr Precision SINGLE = {"single precision", biquad_single, biquad_single_reference, SINGLE_LANES};
constexpr Precision HALF = {"half precision", biquad_half, biquad_half_reference, HALF_LANES};

struct Settings {
  double bass, middle, treble;
};

Settings parse(Options& options) {
  Settings s;
  s.bass = options.number("bass", -4, -12, 12, "dB below 300 Hz");
  s.middle = options.number("middle", -6, -12, 12, "dB about 1 kHz");
  s.treble = options.number("treble", 3, -12, 12, "dB above 4 kHz");
  options.finish();
  return s;
}

std::string describe(const Settings& s) {
  return "bass " + Options::brief(s.bass) + " dB, middle " + Options::brief(s.middle) + " dB, treble " +
         Options::brief(s.treble) + " dB";
}

std::vector<Section> equaliser(const Settings& s, double rate) {
  if (rate < 10000) throw Failure("the equaliser needs a sample rate of at least 10000 Hz");
  return {shelf(300 / rate, s.bass, 1), peak(1000 / rate, s.middle, 1), shelf(4000 / rate, s.treble, -1)};
}

int count_of(const std::vector<Section>& sections) { return static_cast<int>(sections.size()); }

// The sound by the kernel: cut into as many pieces as a register has lanes, and each lane filters a piece. A lane
// starts RUN_IN samples before its piece, and what it makes of those is dropped; before the first piece is silence.
// Every lane is checked against plain C, which filters the same samples one after the other.
Samples equalised(Program& program, const Precision& precision, const std::vector<Section>& sections,
                  const Samples& sound) {
  const std::size_t lanes = precision.lanes;
  const std::size_t piece = (sound.size() + lanes - 1) / lanes, frames = piece + RUN_IN;
  Samples x(frames * lanes), y(frames * lanes), plain(frames * lanes), out(piece * lanes);
  for (std::size_t l = 0; l < lanes; ++l) {
    Samples lane(frames), expected(frames);
    for (std::size_t f = 0; f < frames; ++f) {
      const std::size_t place = l * piece + f;  // in the sound, RUN_IN samples late
      if (place >= RUN_IN && place - RUN_IN < sound.size()) lane[f] = sound[place - RUN_IN];
      x[f * lanes + l] = lane[f];
    }
    precision.plain(sections.data(), count_of(sections), lane.data(), expected.data(), static_cast<int>(frames));
    for (std::size_t f = 0; f < frames; ++f) plain[f * lanes + l] = expected[f];
  }
  precision.kernel(sections.data(), count_of(sections), x.data(), y.data(), static_cast<int>(frames));
  program.equal(std::string("samples in ") + precision.name, y, plain);
  for (std::size_t l = 0; l < lanes; ++l)
    for (std::size_t f = 0; f < piece; ++f) out[l * piece + f] = y[(f + RUN_IN) * lanes + l];
  out.resize(sound.size());
  return out;
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
std::vector<double> measured(const Precision& precision, const std::vector<Section>& sections) {
  constexpr short impulse = 16384;
  Samples x(POINTS * precision.lanes), y(x.size());
  x[0] = impulse;
  precision.kernel(sections.data(), count_of(sections), x.data(), y.data(), static_cast<int>(POINTS));
  std::vector<std::complex<double>> spectrum(POINTS);
  for (std::size_t i = 0; i < POINTS; ++i) spectrum[i] = static_cast<double>(y[i * precision.lanes]) / impulse;
  fourier(spectrum);
  std::vector<double> decibels;
  for (std::size_t k = 0; k <= POINTS / 2; ++k) decibels.push_back(10 * std::log10(std::norm(spectrum[k]) + 1e-20));
  return decibels;
}

void draw(const Program& program, const Settings& s, const std::vector<Section>& sections, double rate) {
  const std::vector<double> hertz = frequencies(POINTS, rate);
  const std::vector<double> designed = response(sections, POINTS);
  Plot plot("Response of the equaliser", describe(s) + "; from an impulse");
  plot.x = {"frequency (Hz)", 20, std::min(rate / 2, 20000.0), true};
  plot.y = {"gain (dB)", std::floor(*std::min_element(designed.begin(), designed.end())) - 1,
            std::ceil(*std::max_element(designed.begin(), designed.end())) + 1};
  plot.background("as designed", hertz, designed, 7);
  for (const Precision& one : {SINGLE, HALF}) plot.curve(one.name, hertz, measured(one, sections));
  write_svg(program.picture, {plot});
}

// Both against plain C in single precision: a processor has no plain C in half precision worth a race.
void tell_speed(const Program& program, const std::vector<Section>& sections) {
  for (const Precision& one : {SINGLE, HALF}) {
    const int frames = 4000, samples = frames * static_cast<int>(one.lanes);
    Samples x(static_cast<std::size_t>(samples), 1000), y(x.size());
    const auto run = [&](Cascade cascade, int of) {
      return [&, cascade, of] { cascade(sections.data(), count_of(sections), x.data(), y.data(), of); };
    };
    program.speed(std::string("samples in ") + one.name, samples,
                  compare(9, run(one.kernel, frames), run(biquad_single_reference, samples)),
                  "without AVX-512, floats are computed in twice the bits and rounded on them");
  }
}

void equalise(Program& program) {
  const Settings s = parse(program.options);
  const Wav before = read_wav(program.input);
  const std::vector<Section> sections = equaliser(s, before.rate);
  program.heading(describe(s), describe(before));
  Wav after = before;
  double signal_over_noise = 0;
  for (unsigned c = 0; c < before.channels; ++c) {
    const Samples sound = before.channel(c);
    const Samples single = equalised(program, SINGLE, sections, sound);
    signal_over_noise += signal_to_noise(single, equalised(program, HALF, sections, sound)) / before.channels;
    after.set_channel(c, single);
  }
  program.checked();
  program.line("noise", "of half precision, %.1f dB below the signal", signal_over_noise);
  tell_speed(program, sections);
  write_wav(program.output, after);
  draw(program, s, sections, before.rate);
  program.written();
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run(
      {"biquad", "equalises a 16-bit WAV in single and in half precision", "guitar.wav", "biquad.wav", "biquad.svg"},
      argc, argv, equalise);
}
