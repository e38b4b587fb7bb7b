// Moves all frequencies of a sound by the same amount, by complex multiplication, checks every number against
// plain C and draws the spectrum before and after.
#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "common/program.h"
#include "common/spectra.h"
#include "mixer/analytic.h"
#include "mixer/mixer.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;

constexpr int TIMED = 1 << 14;  // numbers of a timed run: they stay in the cache

// A channel moved by a carrier; the result is the real part of the products.
Samples moved(Program& program, const Samples& sound, const Samples& w) {
  const Samples x = analytic(sound, MIXER_BLOCK);
  Samples y(x.size()), plain(x.size());
  mix(x.data(), w.data(), y.data(), static_cast<int>(x.size() / 2));
  mix_reference(x.data(), w.data(), plain.data(), static_cast<int>(x.size() / 2));
  program.equal("real and imaginary parts", y, plain);
  Samples real(sound.size());
  for (std::size_t n = 0; n < real.size(); ++n) real[n] = y[2 * n];
  return real;
}

void tell_speed(const Program& program, const Samples& sound, const Samples& w) {
  const auto timed = std::min<std::ptrdiff_t>(TIMED, static_cast<std::ptrdiff_t>(sound.size()));
  const Samples x = analytic(Samples(sound.begin(), sound.begin() + timed), MIXER_BLOCK);
  const int count = static_cast<int>(x.size() / 2);
  Samples y(x.size());
  const auto run = [&](auto* mixer) {
    return [&, mixer] {
      for (int i = 0; i < 8; ++i) mixer(x.data(), w.data(), y.data(), count);
    };
  };
  program.speed("numbers", 8.0 * count, compare(21, run(&mix), run(&mix_reference)));
}

void move_sound(Program& program) {
  const double shift =
      program.options.number("shift", 2000, -1e5, 1e5, "how far frequencies move, in Hz; down when negative");
  program.options.finish();
  const Wav before = read_wav(program.input);
  if (std::fabs(shift) >= before.rate / 2.0)
    throw Failure("--shift must lie within half the sample rate, " + Options::brief(before.rate / 2.0) + " Hz");
  const Samples w = carrier(shift / before.rate, before.frames(), MIXER_BLOCK);

  const std::string what = "moved by " + Options::brief(shift) + " Hz";
  program.heading(what, describe(before));
  Wav after = before;
  for (unsigned c = 0; c < before.channels; ++c) after.set_channel(c, moved(program, before.channel(c), w));
  program.checked();
  tell_speed(program, before.channel(0), w);
  write_wav(program.output, after);
  write_svg(program.picture, {spectra("Spectrum before and after", program.input_name() + ", " + what, before, after)});
  program.written();
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run({"mixer", "moves all frequencies of a 16-bit WAV", "guitar.wav", "mixer.wav", "mixer.svg"}, argc,
                       argv, move_sound);
}
