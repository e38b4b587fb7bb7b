// How long a kernel and plain C take for the same. They run by turns, so that whatever else the machine does
// hits both, and the medians are compared.
#ifndef KASTARRI_EXAMPLES_TIMING_H
#define KASTARRI_EXAMPLES_TIMING_H

#include <algorithm>
#include <chrono>
#include <vector>

namespace examples {

template <class F>
double seconds(F&& f) {
  using Clock = std::chrono::steady_clock;
  const auto start = Clock::now();
  f();
  return std::chrono::duration<double>(Clock::now() - start).count();
}

inline double median(std::vector<double> values) {
  const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
  std::nth_element(values.begin(), middle, values.end());
  return *middle;
}

struct Timing {
  double kernel;  // seconds, the median
  double plain;
  double ratio() const { return plain / kernel; }
};

template <class Kernel, class Plain>
Timing compare(int repetitions, Kernel&& kernel, Plain&& plain) {
  std::vector<double> kernel_times, plain_times;
  for (int i = 0; i < repetitions; ++i) {
    kernel_times.push_back(seconds(kernel));
    plain_times.push_back(seconds(plain));
  }
  return {median(kernel_times), median(plain_times)};
}

}  // namespace examples

#endif
