// Times the FIR filter of examples/fir with 16 taps, the kernel and the plain scalar loop, each on the same
// samples: the ratio of the two is what a program gains from the kernel.
#include <benchmark/benchmark.h>

#include <random>
#include <vector>

#include "fir/fir.h"

namespace {

void time_fir(benchmark::State& state, decltype(fir)* filter) {
  constexpr int taps = 16;
  constexpr int samples = 4096;
  std::minstd_rand random(1);
  std::vector<short> x(samples + taps - 1 + FIR_MARGIN), y(samples + FIR_MARGIN), h(taps);
  for (auto& sample : x) sample = static_cast<short>(random());
  for (auto& tap : h) tap = static_cast<short>(random() % 4096);
  for (auto _ : state) {
    filter(x.data(), h.data(), taps, y.data(), samples);
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * samples);
}

const auto* const timed_kernel =
    benchmark::RegisterBenchmark("fir_kernel", [](benchmark::State& state) { time_fir(state, fir); });
const auto* const timed_scalar =
    benchmark::RegisterBenchmark("fir_scalar", [](benchmark::State& state) { time_fir(state, fir_reference); });

}  // namespace
