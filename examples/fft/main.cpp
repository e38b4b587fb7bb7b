// Draws the spectrogram of a sound: its spectrum through windows that follow one another. Checks every number of every
// transform against plain C, and tells how far the 16 bits of the core are from doubles.
#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "common/program.h"
#include "common/progress.h"
#include "common/svg.h"
#include "fft/design.h"
#include "fft/fft.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;

constexpr double DARKEST = -100, BRIGHTEST = -10;  // dB

struct Settings {
  int hop;
  double top;
};

Settings parse(Options& options) {
  Settings s;
  s.hop = options.integer("hop", 256, 32, FFT_SIZE, "from one window to the next, in samples");
  s.top = options.number("top", 6000, 100, 1e6, "the highest frequency that is drawn, in Hz");
  options.finish();
  return s;
}

// The spectrogram, a column a window and a row a frequency, 0 Hz at the bottom. The darkest grey is 0, white is 255.
Picture spectrogram(Program& program, const Settings& s, const Wav& sound) {
  Progress progress("transforming");
  const Samples table = turns();
  const int columns = std::max(1, static_cast<int>(sound.frames() / static_cast<std::size_t>(s.hop)));
  const int rows = std::min(FFT_SIZE / 2, static_cast<int>(std::ceil(s.top / sound.rate * FFT_SIZE)));
  Picture picture(columns, rows);
  Noise noise;
  for (int column = 0; column < columns; ++column) {
    const Samples x = windowed(sound, static_cast<std::size_t>(column * s.hop + s.hop / 2));
    Samples y(x.size()), plain(x.size());
    const std::vector<int> exponent = {fft(x.data(), table.data(), y.data())};
    program.equal("exponents", exponent, {fft_reference(x.data(), table.data(), plain.data())});
    program.equal("real and imaginary parts", y, plain);
    noise.add(x, y, exponent[0]);
    for (int row = 0; row < rows; ++row) {
      const double level = decibels(y, exponent[0], sound.channels, static_cast<std::size_t>(row));
      const double grey = 255 * (level - DARKEST) / (BRIGHTEST - DARKEST);
      picture.row(rows - 1 - row)[column] = static_cast<std::uint8_t>(std::lround(std::clamp(grey, 0.0, 255.0)));
    }
    progress.show(column, columns);
  }
  program.checked();
  if (noise.noise > 0) program.line("noise", "%.1f dB below the signal, against doubles", noise.ratio());
  return picture;
}

// On a window in the middle of the sound.
void tell_speed(const Program& program, const Wav& sound) {
  const Samples table = turns(), x = windowed(sound, sound.frames() / 2);
  Samples y(x.size());
  const auto run = [&](auto* transform) {
    return [&, transform] {
      for (int i = 0; i < 16; ++i) transform(x.data(), table.data(), y.data());
    };
  };
  program.speed("numbers", 16.0 * FFT_SIZE, compare(21, run(&fft), run(&fft_reference)));
}

// The sound as it goes: the lowest and the highest sample of both channels in each of some short pieces.
Plot waveform(const std::string& title, const std::string& subtitle, const Wav& sound) {
  constexpr std::size_t PIECES = 800;
  Plot plot(title, subtitle);
  plot.height = 240;
  plot.x = {"time (s)", 0, static_cast<double>(sound.frames()) / sound.rate};
  plot.y = {"sample", -1, 1};
  std::vector<double> times, levels;
  for (std::size_t i = 0; i < std::min(PIECES, sound.frames()); ++i) {
    const auto at = [&](std::size_t piece) {
      const std::size_t frame = piece * sound.frames() / std::min(PIECES, sound.frames());
      return sound.samples.begin() + static_cast<std::ptrdiff_t>(frame * sound.channels);
    };
    const auto ends = std::minmax_element(at(i), at(i + 1));
    for (int k = 0; k < 2; ++k) {
      times.push_back((static_cast<double>(i) + k / 2.0) * plot.x.high / PIECES);
      levels.push_back((k == 0 ? *ends.first : *ends.second) / 32768.0);
    }
  }
  plot.curve("the sound", times, levels);
  return plot;
}

void draw(const Program& program, const Settings& s, const Wav& sound, const Picture& levels) {
  const std::string what = program.input_name() + ", " + describe(sound);
  const Plot before = waveform("Before: the sound", what, sound);
  Plot after("After: its spectrogram",
             "transforms of 1,024 points, one every " + std::to_string(s.hop) + " samples, under a Hann window");
  after.x = {"time (s)", 0, static_cast<double>(levels.width) * s.hop / sound.rate};
  const double step = static_cast<double>(sound.rate) / FFT_SIZE;
  after.y = {"frequency (Hz)", -step / 2, (levels.height - 0.5) * step};  // the lowest row is about 0 Hz
  after.picture("power (dB, 0 = a sine of full scale)", levels, DARKEST, BRIGHTEST);
  write_svg(program.picture, {before, after});
}

void draw_sound(Program& program) {
  const Settings s = parse(program.options);
  const Wav sound = read_wav(program.input);
  program.heading("spectrogram, 1024 points every " + std::to_string(s.hop) + " samples", describe(sound));
  const Picture levels = spectrogram(program, s, sound);
  tell_speed(program, sound);
  write_pgm(program.output, levels);
  draw(program, s, sound, levels);
  program.written();
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run({"fft", "draws the spectrogram of a 16-bit WAV", "guitar.wav", "fft.pgm", "fft.svg"}, argc, argv,
                       draw_sound);
}
