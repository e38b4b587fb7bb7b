// Times kernels as several modules have them: with the intrinsics of the shared library, inlined, as loops that
// compilers vectorised, as plain loops. Prints kernel, module, nanoseconds an item, separated by commas.
#include <dlfcn.h>

#include <algorithm>
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

int rounds = 61;

struct Way {
  std::string name;
  const Kernels* kernels;
};

Way load(const std::string& argument) {
  const std::size_t equals = argument.find('=');
  void* const module = dlopen(argument.substr(equals + 1).c_str(), RTLD_NOW | RTLD_LOCAL);
  const void* const kernels = module ? dlsym(module, "kernels") : nullptr;
  if (kernels) return {argument.substr(0, equals), static_cast<const Kernels*>(kernels)};
  std::fprintf(stderr, "%s\n", dlerror());
  std::exit(1);
}

// Runs the ways by turns, so that whatever else the machine does hits all, and takes the shortest time of each. All
// have to make the same, which `made` returns.
template <class Has, class Run, class Made>
void compare_ways(const std::string& title, const std::vector<Way>& all, int repetitions, double items, Has has,
                  Run run, Made made) {
  std::vector<Way> ways;
  std::copy_if(all.begin(), all.end(), std::back_inserter(ways), [&](const Way& way) { return has(*way.kernels); });
  if (ways.empty()) return;
  run(*ways[0].kernels);
  const auto expected = made();
  std::vector<double> least(ways.size(), 1e9);
  for (int round = 0; round < rounds; ++round) {
    for (std::size_t w = 0; w < ways.size(); ++w) {
      least[w] = std::min(least[w], seconds([&] {
                            for (int i = 0; i < repetitions; ++i) run(*ways[w].kernels);
                          }));
      if (made() != expected) {
        std::fprintf(stderr, "%s: %s differs from %s\n", title.c_str(), ways[w].name.c_str(), ways[0].name.c_str());
        std::exit(1);
      }
    }
  }
  for (std::size_t w = 0; w < ways.size(); ++w)
    std::printf("%s,%s,%.4f\n", title.c_str(), ways[w].name.c_str(), 1e9 * least[w] / repetitions / items);
}

template <class Has, class Run>
void compare_filters(const std::string& title, const std::vector<Way>& ways, int taps, Has has, Run run) {
  constexpr int samples = 4096;
  std::minstd_rand random(1);
  std::vector<short> x(static_cast<std::size_t>(samples + taps - 1 + FIR_MARGIN)), y(samples + FIR_MARGIN);
  std::vector<short> h(static_cast<std::size_t>(taps));
  for (auto& sample : x) sample = static_cast<short>(random());
  for (auto& tap : h) tap = static_cast<short>(random() % 4096);
  compare_ways(
      title, ways, 4, samples, has,
      [&](const Kernels& kernels) { run(kernels, x.data(), h.data(), y.data(), samples); }, [&] { return y; });
}

void compare_fir(const std::vector<Way>& ways, int taps) {
  compare_filters(
      "FIR of " + std::to_string(taps) + " taps", ways, taps, [](const Kernels& k) { return k.fir != nullptr; },
      [&](const Kernels& k, const short* x, const short* h, short* y, int count) { k.fir(x, h, taps, y, count); });
}

void compare_chain(const std::vector<Way>& ways) {
  compare_filters(
      "chain of MULANX16", ways, CHAIN_TAPS, [](const Kernels& k) { return k.chain != nullptr; },
      [](const Kernels& k, const short* x, const short* h, short* y, int count) {
        k.chain(x, h, CHAIN_TAPS, y, count);
      });
}

// The chain with its registers at an offset from a cache line.
void compare_chain_at(const std::vector<Way>& ways, int offset) {
  alignas(64) static unsigned char frame[CHAIN_FRAME];
  compare_filters(
      "chain at " + std::to_string(offset) + " mod 64", ways, CHAIN_TAPS,
      [](const Kernels& k) { return k.chain_at != nullptr; },
      [&](const Kernels& k, const short* x, const short* h, short* y, int count) {
        k.chain_at(x, h, y, count, frame + offset);
      });
}

void compare_convolution(const std::vector<Way>& ways, const char* name, const Filter& filter) {
  Picture picture(256, 128);
  std::minstd_rand random(1);
  for (auto& pixel : picture.pixels) pixel = static_cast<std::uint8_t>(random() >> 16);
  const Framed in(picture);
  Convolved out(picture.width, picture.height);
  compare_ways(
      name, ways, 1, 256 * 128, [](const Kernels& k) { return k.convolve != nullptr; },
      [&](const Kernels& kernels) { out.make(kernels.convolve, in, filter); }, [&] { return out.picture().pixels; });
}

void compare_floats(const std::vector<Way>& ways) {
  constexpr int samples = 1024;
  std::minstd_rand random(1);
  std::vector<float> a(samples), b(samples), c(samples), gain(16), y(samples);
  for (auto* const operand : {&a, &b, &c, &gain})
    for (float& x : *operand)
      x = std::ldexp(1 + static_cast<float>(random() % 1000) / 1000, static_cast<int>(random() % 24) - 12);
  compare_ways(
      "float multiply-add and multiply", ways, 32, samples,
      [](const Kernels& k) { return k.multiply_add_multiply != nullptr; },
      [&](const Kernels& k) { k.multiply_add_multiply(a.data(), b.data(), c.data(), gain.data(), y.data(), samples); },
      [&] { return y; });
}

void compare_tables(const std::vector<Way>& ways) {
  constexpr int pixels = 16384;
  std::minstd_rand random(1);
  std::vector<unsigned char> picture(pixels + PIXEL_MARGIN), table(GREYS + 1), found(pixels);
  for (auto& pixel : picture) pixel = static_cast<unsigned char>(random() >> 16);
  for (auto& entry : table) entry = static_cast<unsigned char>(random() >> 16);
  std::vector<unsigned> counts(GREYS);
  compare_ways(
      "table look-up", ways, 2, pixels, [](const Kernels& k) { return k.look_up != nullptr; },
      [&](const Kernels& k) { k.look_up(picture.data(), pixels, table.data(), found.data()); }, [&] { return found; });
  compare_ways(
      "histogram", ways, 2, pixels, [](const Kernels& k) { return k.count_greys != nullptr; },
      [&](const Kernels& k) { k.count_greys(picture.data(), pixels, counts.data()); }, [&] { return counts; });
}

}  // namespace

int main(int argc, char** argv) {
  std::vector<Way> ways;
  for (int i = 1; i < argc; ++i) {
    const std::string argument = argv[i];
    if (argument.rfind("--rounds=", 0) == 0)
      rounds = std::atoi(argv[i] + 9);
    else if (argument.find('=') != std::string::npos)
      ways.push_back(load(argument));
  }
  if (ways.empty()) {
    std::fprintf(stderr, "usage: kernel_bench [--rounds=N] NAME=MODULE...\n");
    return 2;
  }
  for (const int taps : {16, 64}) compare_fir(ways, taps);
  compare_convolution(ways, "convolution 5 x 5", gauss());
  compare_convolution(ways, "four masks of 3 x 3", sobel());
  compare_chain(ways);
  for (const int offset : {0, 16, 32}) compare_chain_at(ways, offset);
  compare_floats(ways);
  compare_tables(ways);
}
