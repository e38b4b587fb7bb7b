// Runs a kernel that lives on the core's ports: the input queue delivers a sound from a file, the output queue
// takes it away to another. Once with queues that block and once with queues that are polled; every sample of
// both is checked against plain C.
#include <cmath>
#include <string>
#include <vector>

#include "common/program.h"
#include "common/progress.h"
#include "common/wav.h"
#include "ports/host.h"
#include "ports/scale.h"

namespace {

using namespace examples;
using Samples = std::vector<short>;

// What comes out of the output queue when the sound goes into the input queue.
Samples through_ports(const Program& program, const char* name, unsigned (*kernel)(int), const Samples& sound,
                      int gain) {
  Progress progress(name);
  Host host(sound, gain, progress);
  const unsigned waits = kernel(host.entries());
  program.line(name, "%d entries, a queue was not ready %u times", host.entries(), waits);
  return host.output();
}

void scale(Program& program) {
  const double factor = program.options.number("gain", 0.5, -8, 7.999, "the factor of the samples");
  program.options.finish();
  const int gain = static_cast<int>(std::lround(factor * (1 << GAIN_BITS)));
  Wav sound = read_wav(program.input);
  program.heading("gain " + Options::brief(static_cast<double>(gain) / (1 << GAIN_BITS)), describe(sound));

  Samples plain(sound.samples.size());
  scale_reference(sound.samples.data(), gain, plain.data(), static_cast<int>(plain.size()));
  const Samples blocking = through_ports(program, "blocking", scale_blocking, sound.samples, gain);
  const Samples polling = through_ports(program, "polling", scale_polling, sound.samples, gain);
  program.equal("samples", blocking, plain);
  program.equal("samples", polling, plain);
  program.checked();

  sound.samples = polling;
  write_wav(program.output, sound);
  program.written();
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run(
      {"ports", "changes the volume of a 16-bit WAV by way of the core's queues", "guitar.wav", "ports.wav", nullptr},
      argc, argv, scale);
}
