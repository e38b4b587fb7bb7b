// Runs a kernel that lives on the core's ports: the input queue delivers a sound from a file, the output queue
// takes it away to another. Once with queues that block and once with queues that are polled; every sample of
// both is checked against plain scalar code.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <string>
#include <vector>

#include "common/failure.h"
#include "common/options.h"
#include "common/progress.h"
#include "common/wav.h"
#include "ports/host.h"
#include "ports/scale.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;

struct Settings {
  std::string input, output;
  int gain;  // with GAIN_BITS behind the point
};

Settings parse(int argc, char** argv) {
  Options options(argc, argv, "changes the volume of a 16-bit WAV by way of the core's queues");
  Settings s;
  s.input = options.path("input", EXAMPLE_DATA "/guitar.wav", "the sound: 16-bit PCM, mono or stereo");
  s.output = options.path("output", "ports.wav", "where the changed sound goes");
  const double gain = options.number("gain", 0.5, -8, 7.999, "the factor of the samples");
  s.gain = static_cast<int>(std::lround(gain * (1 << GAIN_BITS)));
  options.finish();
  return s;
}

// What comes out of the output queue when the sound goes into the input queue.
Samples through_ports(const char* name, unsigned (*kernel)(int), const Samples& sound, int gain) {
  Progress progress(name);
  Host host(sound, gain, progress);
  const unsigned waits = kernel(host.entries());
  std::printf("  %-9s %d entries, a queue was not ready %u times\n", name, host.entries(), waits);
  return host.output();
}

// Throws if a single sample differs from the scalar version.
void check(const char* name, const Samples& got, const Samples& expected) {
  const auto differ = std::mismatch(got.begin(), got.end(), expected.begin(), expected.end());
  if (differ.first == got.end() && differ.second == expected.end()) return;
  throw std::runtime_error(std::string(name) + ": sample " + std::to_string(differ.first - got.begin()) +
                           " differs from the scalar version");
}

int scale(int argc, char** argv) {
  const Settings s = parse(argc, argv);
  Wav sound = read_wav(s.input);
  std::printf("%s: %zu samples, gain %g\n", s.input.c_str(), sound.samples.size(),
              static_cast<double>(s.gain) / (1 << GAIN_BITS));

  Samples expected(sound.samples.size());
  scale_reference(sound.samples.data(), s.gain, expected.data(), static_cast<int>(expected.size()));
  const Samples blocking = through_ports("blocking", scale_blocking, sound.samples, s.gain);
  check("blocking", blocking, expected);
  const Samples polling = through_ports("polling", scale_polling, sound.samples, s.gain);
  check("polling", polling, expected);
  std::printf("  check     all %zu samples equal those of the scalar version, both times\n", expected.size());

  sound.samples = polling;
  write_wav(s.output, sound);
  std::printf("  written   %s\n", s.output.c_str());
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run("ports", [&] { return scale(argc, argv); });
}
