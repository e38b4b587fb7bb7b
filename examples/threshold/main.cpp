// Parts a photograph into dark and light with the core's intrinsics, checks every pixel against plain
// scalar code, tells how fast both are and writes the picture.
#include <algorithm>
#include <cstdio>
#include <string>

#include "common/options.h"
#include "common/pgm.h"
#include "common/timing.h"
#include "threshold/threshold.h"

namespace {

using namespace examples;

constexpr int AUTOMATIC = -1;

struct Settings {
  std::string input, output;
  int level, shift;
};

Settings parse(int argc, char** argv) {
  Options options(argc, argv, "parts an 8-bit grey PGM into dark and light");
  Settings s;
  s.input = options.path("input", EXAMPLE_DATA "/camera.pgm", "the photograph");
  s.output = options.path("output", "threshold.pgm", "where the picture goes");
  s.level = options.integer("level", AUTOMATIC, AUTOMATIC, 255, "the highest grey that is dark; -1 finds it");
  s.shift = options.integer("shift", 0, 0, 7, "0 makes black and white; each step more leaves twice the greys");
  options.finish();
  return s;
}

using Lighter = Part(const std::uint8_t*, int, int);

// Starts at the mean of all pixels and moves to the middle between the means of both parts until it stays.
// A higher level never makes the next one lower, so levels go one way, and at most 255 steps of it.
int find_level(Lighter* lighter_of, const std::uint8_t* pixels, int count) {
  const auto mean = [](const Part& part, std::uint64_t otherwise) { return part.pixels ? part.sum / part.pixels : otherwise; };
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

// Throws if a single pixel differs from the scalar version.
void check(const Picture& got, const Picture& expected) {
  const auto differ = std::mismatch(got.pixels.begin(), got.pixels.end(), expected.pixels.begin());
  if (differ.first == got.pixels.end()) return;
  const auto at = static_cast<int>(differ.first - got.pixels.begin());
  throw std::runtime_error("pixel " + std::to_string(at % got.width) + ", " + std::to_string(at / got.width) + " is " +
                           std::to_string(*differ.first) + ", and " + std::to_string(*differ.second) +
                           " in the scalar version");
}

int threshold(int argc, char** argv) {
  const Settings s = parse(argc, argv);
  Picture photograph = read_pgm(s.input);
  const auto count = static_cast<int>(photograph.pixels.size());
  std::printf("threshold: %s, %d x %d pixels\n", s.input.c_str(), photograph.width, photograph.height);

  Picture parted = photograph;
  Picture expected = photograph;
  for (Picture* picture : {&photograph, &parted, &expected})
    picture->pixels.resize(static_cast<std::size_t>(count + THRESHOLD_MARGIN));
  const auto run = [&](Lighter* lighter_of, decltype(part)* part_at, Picture& result) {
    const std::uint8_t* const pixels = photograph.pixels.data();
    const int level = s.level == AUTOMATIC ? find_level(lighter_of, pixels, count) : s.level;
    part_at(pixels, result.pixels.data(), count, level, s.shift);
    return level;
  };
  const int level = run(&lighter, &part, parted);
  const int expected_level = run(&lighter_reference, &part_reference, expected);
  const Timing timing = compare(
      15, [&] { run(&lighter, &part, parted); }, [&] { run(&lighter_reference, &part_reference, expected); });

  for (Picture* picture : {&parted, &expected}) picture->pixels.resize(static_cast<std::size_t>(count));
  if (level != expected_level) {
    throw std::runtime_error("the level is " + std::to_string(level) + ", and " + std::to_string(expected_level) +
                             " in the scalar version");
  }
  check(parted, expected);
  const Part light = lighter_reference(photograph.pixels.data(), count, level);
  std::printf("  level     %d%s: %.1f %% of the pixels are light\n", level, s.level == AUTOMATIC ? " (found)" : "",
              100.0 * static_cast<double>(light.pixels) / count);
  std::printf("  checked   all %d pixels and the level equal those of the scalar version\n", count);
  std::printf("  speed     %.1f million pixels a second, %.2f times the scalar version (%.1f)\n",
              count / timing.kernel / 1e6, timing.ratio(), count / timing.scalar / 1e6);
  write_pgm(s.output, parted);
  std::printf("  wrote     %s\n", s.output.c_str());
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run("threshold", [&] { return threshold(argc, argv); });
}
