// What loops of calls in C++ cost: for each intrinsic named on the standard input nanoseconds a call, on blocks of
// 1,000 registers, the least of many runs. bench.py compares calls from Python with them.
#include <chrono>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "kastarri/names.h"

namespace {

constexpr int count = 1000;

// Small numbers, of floats such about 1.
template <class T>
std::vector<T> registers() {
  // Of another length each, so that arrays do not lie alike to pages.
  static std::size_t longer = 0;
  std::vector<T> all(count + ++longer % 7);
  if constexpr (std::is_same_v<T, qv_vecN_2xf32>) {
    for (std::size_t i = 0; i < count; ++i) all[i] = 0.5f + static_cast<float>(i % 37);
  } else {
    std::memset(all.data(), 0, count * sizeof(T));
    auto* bytes = reinterpret_cast<unsigned char*>(all.data());
    for (std::size_t i = 0; i < count * sizeof(T); i += 4) bytes[i] = static_cast<unsigned char>(i * 37 % 60);
  }
  return all;
}

template <class Loop>
double nanoseconds(Loop loop) {
  using Clock = std::chrono::steady_clock;
  double least = 1e9;
  for (int run = 0; run < 400; ++run) {
    const auto begin = Clock::now();
    loop();
    asm volatile("" : : : "memory");
    const std::chrono::duration<double, std::nano> taken = Clock::now() - begin;
    if (taken.count() < least) least = taken.count();
  }
  return least / count;
}

// r = f(a ...)
template <class R, class... A>
double time_of(R (*f)(const A&...)) {
  return [f](const std::vector<A>&... a) {
    auto r = registers<R>();
    return nanoseconds([&] {
      for (std::size_t i = 0; i < count; ++i) r[i] = f(a[i]...);
    });
  }(registers<A>()...);
}
template <class R, class A>
double time_of(R (*f)(const A&, int), int immediate) {
  const auto a = registers<A>();
  auto r = registers<R>();
  return nanoseconds([&] {
    for (std::size_t i = 0; i < count; ++i) r[i] = f(a[i], immediate);
  });
}
// f(r, a ...), which changes r
template <class R, class... A>
double time_of(void (*f)(R&, const A&...)) {
  return [f](const std::vector<A>&... a) {
    auto r = registers<R>();
    return nanoseconds([&] {
      for (std::size_t i = 0; i < count; ++i) f(r[i], a[i]...);
    });
  }(registers<A>()...);
}
// f(memory, offset), register after register
template <class R, class M>
double time_of_load(R (*f)(const M*, int)) {
  const auto memory = registers<R>();
  auto r = registers<R>();
  return nanoseconds([&] {
    for (std::size_t i = 0; i < count; ++i)
      r[i] = f(reinterpret_cast<const M*>(memory.data()), static_cast<int>(i * sizeof(R)));
  });
}

struct Named {
  const char* name;
  double (*time)();
};

#define LOOP(NAME, ...)               \
  Named {                             \
#NAME, [] { return __VA_ARGS__; } \
  }
#define CALLED(NAME) LOOP(NAME, time_of(ZRA_##NAME))
const Named loops[] = {CALLED(ADDNX16),
                       CALLED(ADDSNX16),
                       CALLED(ADDSNX16T),
                       CALLED(LTNX16),
                       CALLED(MULNX16),
                       CALLED(MULANX16),
                       CALLED(MULA2NX8),
                       CALLED(ADDN_2XF32),
                       CALLED(MULAN_2XF32),
                       CALLED(RADDNX16),
                       LOOP(SRAINX16, time_of(ZRA_SRAINX16, 3)),
                       LOOP(PACKVRNX48, time_of(ZRA_PACKVRNX48, 4)),
                       LOOP(LVNX16_I, time_of_load(ZRA_LVNX16_I))};

double time_by_name(const std::string& name) {
  for (const Named& loop : loops)
    if (name == loop.name) return loop.time();
  return 0;
}

}  // namespace

int main() {
  char name[64];
  while (std::scanf("%63s", name) == 1) {
    std::printf("%.3f\n", time_by_name(name));
    std::fflush(stdout);
  }
}
