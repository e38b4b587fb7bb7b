// Times kernels three ways, for one target: linked with the shared library, inlined from the static library
// when linked, and plain loops that the compiler vectorised. Prints how much faster than with the shared
// library they are.
#include <dlfcn.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <random>
#include <string>
#include <vector>

#include "common/timing.h"
#include "convolve/filters.h"
#include "kernels.h"

namespace {

using namespace examples;

constexpr int ROUNDS = 61;

struct Way {
  const char* name;
  const Kernels* kernels;
};

const Kernels* load(const char* path) {
  void* const module = dlopen(path, RTLD_NOW | RTLD_LOCAL);
  const void* const kernels = module ? dlsym(module, "kernels") : nullptr;
  if (kernels) return static_cast<const Kernels*>(kernels);
  std::fprintf(stderr, "%s\n", dlerror());
  std::exit(1);
}

// Runs the ways by turns, so that whatever else the machine does hits all, and compares the medians. All have to
// make the same, which `made` returns.
template <class Run, class Made>
void compare_ways(const std::string& title, const std::vector<Way>& ways, int repetitions, double items, Run run,
                  Made made) {
  run(*ways[0].kernels);
  const auto expected = made();
  std::vector<std::vector<double>> times(ways.size());
  for (int round = 0; round < ROUNDS; ++round) {
    for (std::size_t w = 0; w < ways.size(); ++w) {
      times[w].push_back(seconds([&] {
        for (int i = 0; i < repetitions; ++i) run(*ways[w].kernels);
      }));
      if (made() != expected) {
        std::fprintf(stderr, "%s: %s differs from %s\n", title.c_str(), ways[w].name, ways[0].name);
        std::exit(1);
      }
    }
  }
  const double base = median(times[0]);
  std::printf("%s\n", title.c_str());
  for (std::size_t w = 0; w < ways.size(); ++w) {
    const double time = median(times[w]);
    std::printf("  %-8s %7.3f ns   %5.2f\n", ways[w].name, 1e9 * time / repetitions / items, base / time);
  }
}

void compare_fir(const std::vector<Way>& ways, int taps) {
  constexpr int samples = 4096;
  std::minstd_rand random(1);
  std::vector<short> x(static_cast<std::size_t>(samples + taps - 1 + FIR_MARGIN)), y(samples + FIR_MARGIN);
  std::vector<short> h(static_cast<std::size_t>(taps));
  for (auto& sample : x) sample = static_cast<short>(random());
  for (auto& tap : h) tap = static_cast<short>(random() % 4096);
  const std::string title = "FIR, " + std::to_string(taps) + " taps, a sample";
  compare_ways(
      title, ways, 8, samples,
      [&](const Kernels& kernels) { kernels.fir(x.data(), h.data(), taps, y.data(), samples); }, [&] { return y; });
}

void compare_convolution(const std::vector<Way>& ways, const char* name, const Filter& filter) {
  Picture picture(256, 128);
  std::minstd_rand random(1);
  for (auto& pixel : picture.pixels) pixel = static_cast<std::uint8_t>(random() >> 16);
  const Framed in(picture);
  Convolved out(picture.width, picture.height);
  const std::string title = std::string("convolution, ") + name + ", a pixel";
  compare_ways(
      title, ways, 2, 256 * 128, [&](const Kernels& kernels) { out.make(kernels.convolve, in, filter); },
      [&] { return out.picture().pixels; });
}

void compare_floats(const std::vector<Way>& ways) {
  constexpr int samples = 1024;
  std::minstd_rand random(1);
  std::vector<float> a(samples), b(samples), c(samples), gain(16), y(samples);
  for (auto* const operand : {&a, &b, &c, &gain})
    for (float& x : *operand)
      x = std::ldexp(1 + static_cast<float>(random() % 1000) / 1000, static_cast<int>(random() % 24) - 12);
  compare_ways(
      "multiply-add, multiply, a single", ways, 32, samples,
      [&](const Kernels& kernels) {
        kernels.multiply_add_multiply(a.data(), b.data(), c.data(), gain.data(), y.data(), samples);
      },
      [&] { return y; });
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 4) {
    std::fprintf(stderr, "usage: static_bench SHARED STATIC PLAIN (the modules with the kernels)\n");
    return 2;
  }
  const std::vector<Way> ways = {{"shared", load(argv[1])}, {"static", load(argv[2])}, {"plain", load(argv[3])}};
  for (const int taps : {16, 64}) compare_fir(ways, taps);
  compare_convolution(ways, "5 x 5", gauss());
  compare_convolution(ways, "four of 3 x 3", sobel());
  compare_floats(ways);
}
