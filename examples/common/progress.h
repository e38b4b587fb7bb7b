// A progress bar for work that lasts longer than a third of a second, on standard error if that is a terminal.
#ifndef KASTARRI_EXAMPLES_PROGRESS_H
#define KASTARRI_EXAMPLES_PROGRESS_H

#include <chrono>
#include <cstdio>
#include <string>
#include <utility>

#include <unistd.h>

namespace examples {

class Progress {
 public:
  explicit Progress(std::string what) : what_(std::move(what)), terminal_(::isatty(STDERR_FILENO) != 0) {}
  Progress(const Progress&) = delete;
  Progress& operator=(const Progress&) = delete;
  ~Progress() {
    if (drawn_ >= 0) std::fprintf(stderr, "\r\033[K");
  }

  // `done` of `total` are done.
  void show(double done, double total) {
    const int percent = total > 0 ? static_cast<int>(100 * done / total) : 100;
    if (!terminal_ || percent == drawn_ || Clock::now() - start_ < std::chrono::milliseconds(300)) return;
    drawn_ = percent;
    const int filled = percent * WIDTH / 100;
    const std::string bar =
        std::string(static_cast<std::size_t>(filled), '#') + std::string(static_cast<std::size_t>(WIDTH - filled), '.');
    std::fprintf(stderr, "\r%s [%s] %3d %%", what_.c_str(), bar.c_str(), percent);
    std::fflush(stderr);
  }

 private:
  using Clock = std::chrono::steady_clock;
  static constexpr int WIDTH = 40;
  std::string what_;
  bool terminal_;
  int drawn_ = -1;
  Clock::time_point start_ = Clock::now();
};

}  // namespace examples

#endif
