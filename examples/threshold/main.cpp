// Parts a photograph into dark and light, and checks every pixel against plain C.
#include <string>

#include "common/pgm.h"
#include "common/program.h"
#include "threshold/threshold.h"

namespace {

using namespace examples;

constexpr int AUTOMATIC = -1;

using Lighter = Part(const std::uint8_t*, int, int);

// The level midway between the mean of the pixels above it and the mean of the others: starts at the mean of all,
// and moves to the middle between both means until it stays. With pixels of 10 and 100 only, half of each, it
// starts at 55, and stays: the means are 10 and 100, their middle is 55.
//
// It does stay: a higher level raises both means or leaves them, so the level never turns round, and there are 256.
int find_level(Lighter* lighter_of, const std::uint8_t* pixels, int count) {
  const auto mean = [](const Part& part, std::uint64_t otherwise) {
    return part.pixels ? part.sum / part.pixels : otherwise;
  };
  const Part all = lighter_of(pixels, count, -1);
  std::uint64_t level = mean(all, 0);
  for (int round = 0; round < 256; ++round) {
    const Part light = lighter_of(pixels, count, static_cast<int>(level));
    const Part dark{all.pixels - light.pixels, all.sum - light.sum};
    const std::uint64_t next = (mean(light, level) + mean(dark, level)) / 2;
    if (next == level) break;
    level = next;
  }
  return static_cast<int>(level);
}

void part_picture(Program& program) {
  const int wanted =
      program.options.integer("level", AUTOMATIC, AUTOMATIC, 255, "the highest grey that is dark; -1 finds it");
  const int shift =
      program.options.integer("shift", 0, 0, 7, "0 makes black and white; each step more leaves twice the greys");
  program.options.finish();
  Picture photograph = read_pgm(program.input);
  const auto count = static_cast<int>(photograph.pixels.size());
  Picture parted = photograph, expected = photograph;
  for (Picture* picture : {&photograph, &parted, &expected})
    picture->pixels.resize(static_cast<std::size_t>(count + THRESHOLD_MARGIN));
  const auto run = [&](Lighter* lighter_of, decltype(part)* part_at, Picture& result) {
    const std::uint8_t* const pixels = photograph.pixels.data();
    const int level = wanted == AUTOMATIC ? find_level(lighter_of, pixels, count) : wanted;
    part_at(pixels, result.pixels.data(), count, level, shift);
    return level;
  };
  const auto kernel = [&] { return run(&lighter, &part, parted); };
  const auto plain = [&] { return run(&lighter_reference, &part_reference, expected); };
  const int level = kernel(), expected_level = plain();

  program.heading("dark up to grey " + std::to_string(level) + (wanted == AUTOMATIC ? ", found" : ""),
                  describe(photograph));
  const auto without_margin = [&](Bytes pixels) {
    pixels.resize(static_cast<std::size_t>(count));
    return pixels;
  };
  program.equal("level", std::vector<int>{level}, {expected_level});
  program.equal("pixels", without_margin(parted.pixels), without_margin(expected.pixels));
  program.checked();
  const Part light = lighter_reference(photograph.pixels.data(), count, level);
  program.line("light", "%.1f %% of the pixels", 100.0 * static_cast<double>(light.pixels) / count);
  program.speed("pixels", count, compare(15, kernel, plain));
  parted.pixels = without_margin(parted.pixels);
  write_pgm(program.output, parted);
  program.written();
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run(
      {"threshold", "parts an 8-bit grey PGM into dark and light", "camera.pgm", "threshold.pgm", nullptr}, argc, argv,
      part_picture);
}
