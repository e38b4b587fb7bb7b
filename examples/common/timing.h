// How long two ways to the same result take. They run by turns, so that whatever else the machine does
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
  double scalar;
  double ratio() const { return scalar / kernel; }
};

template <class Kernel, class Scalar, class AfterEach>
Timing compare(int repetitions, Kernel&& kernel, Scalar&& scalar, AfterEach&& after_each) {
  std::vector<double> kernel_times, scalar_times;
  for (int i = 0; i < repetitions; ++i) {
    kernel_times.push_back(seconds(kernel));
    scalar_times.push_back(seconds(scalar));
    after_each(i + 1, repetitions);
  }
  return {median(kernel_times), median(scalar_times)};
}
template <class Kernel, class Scalar>
Timing compare(int repetitions, Kernel&& kernel, Scalar&& scalar) {
  return compare(repetitions, kernel, scalar, [](int, int) {});
}

}  // namespace examples

#endif
