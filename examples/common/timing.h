// How long a kernel and plain C take for the same: the shortest of several runs by turns. Whatever else the machine
// does makes runs longer, and its slices of time may hit every run of one and none of the other.
#ifndef KASTARRI_EXAMPLES_TIMING_H
#define KASTARRI_EXAMPLES_TIMING_H

#include <algorithm>
#include <chrono>

namespace examples {

template <class F>
double seconds(F&& f) {
  using Clock = std::chrono::steady_clock;
  const auto start = Clock::now();
  f();
  return std::chrono::duration<double>(Clock::now() - start).count();
}

struct Timing {
  double kernel;  // seconds, the shortest
  double plain;
  double ratio() const { return plain / kernel; }
};

template <class Kernel, class Plain>
Timing compare(int repetitions, Kernel&& kernel, Plain&& plain) {
  Timing shortest = {seconds(kernel), seconds(plain)};
  for (int i = 1; i < repetitions; ++i) {
    shortest.kernel = std::min(shortest.kernel, seconds(kernel));
    shortest.plain = std::min(shortest.plain, seconds(plain));
  }
  return shortest;
}

}  // namespace examples

#endif
