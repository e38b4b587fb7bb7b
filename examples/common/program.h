// The frame of every example: its options, the lines that it prints and the check of its kernels. The lines are
//
//   fir: low-pass at 1500 Hz, 64 taps
//     input     guitar.wav, 3.33 s, 44100 Hz, stereo
//     target    avx512
//     check     294000 samples, all equal to plain C
//     speed     122.7 million samples a second, 4.63 times plain C (26.5)
//     written   fir.wav, fir.svg
//
// The exit status is 0 when every value was equal, 1 when one was not, 2 for an input or an option that will not do.
#ifndef KASTARRI_EXAMPLES_PROGRAM_H
#define KASTARRI_EXAMPLES_PROGRAM_H

#include <kastarri.h>

#include <algorithm>
#include <cstdarg>
#include <cstdio>
#include <exception>
#include <filesystem>
#include <new>
#include <string>
#include <vector>

#include "common/failure.h"
#include "common/options.h"
#include "common/timing.h"

namespace examples {

struct About {
  const char* name;
  const char* purpose;
  const char* input;    // the file in data/ that it takes if it is given none
  const char* output;   // where the result goes if nothing else is said
  const char* picture;  // where the picture of what happened goes; nullptr: there is none
};

// A path as people read it: relative when it lies below the directory that they are in.
inline std::string shown(const std::string& path) {
  const std::string near = std::filesystem::path(path).lexically_proximate(std::filesystem::current_path());
  return near.compare(0, 2, "..") == 0 ? path : near;
}

class Program {
 public:
  Program(const About& about, int argc, const char* const* argv)
      : options(argc, argv, about.purpose),
        input(options.path("input", EXAMPLE_DATA "/" + std::string(about.input), kind(about.input))),
        output(options.path("output", about.output, "where the result goes")),
        picture(about.picture ? options.path("picture", about.picture, "where the picture of it goes") : ""),
        name_(about.name) {}

  Options options;
  const std::string input, output, picture;

  std::string input_name() const { return std::filesystem::path(input).filename(); }

  // Begins the report: what is done, to an input of this kind.
  void heading(const std::string& what, const std::string& of_input) const {
    std::printf("%s: %s\n", name_, what.c_str());
    line("input", "%s, %s", shown(input).c_str(), of_input.c_str());
    line("target", "%s", cstub_Km_ZNB_Orbis_R5_64k_target());
  }

  [[gnu::format(printf, 3, 4)]] void line(const char* label, const char* format, ...) const {
    std::printf("  %-9s ", label);
    va_list arguments;
    va_start(arguments, format);
    std::vprintf(format, arguments);
    va_end(arguments);
    std::printf("\n");
  }

  // Throws if the values that the kernel made are not those of plain C, else counts them under their name.
  template <class T>
  void equal(const std::string& name, const std::vector<T>& kernel, const std::vector<T>& plain) {
    if (kernel.size() != plain.size())
      throw Difference(name + ": " + std::to_string(kernel.size()) + ", and " + std::to_string(plain.size()) +
                       " in plain C");
    const auto differ = std::mismatch(kernel.begin(), kernel.end(), plain.begin());
    if (differ.first != kernel.end())
      throw Difference(name + ": number " + std::to_string(differ.first - kernel.begin()) + " is " +
                       std::to_string(*differ.first) + ", and " + std::to_string(*differ.second) + " in plain C");
    const auto same_name = [&](const auto& counted) { return counted.first == name; };
    const auto found = std::find_if(checked_.begin(), checked_.end(), same_name);
    if (found == checked_.end())
      checked_.emplace_back(name, kernel.size());
    else
      found->second += kernel.size();
  }

  // Tells how many values were equal.
  void checked() const {
    std::string counts;
    for (const auto& one : checked_)
      counts += (counts.empty() ? "" : ", ") + std::to_string(one.second) + " " + one.first;
    line("check", "%s, all equal to plain C", counts.c_str());
  }

  // Tells how many of the `count` values were made in a second, and where plain C was quicker, why.
  void speed(const std::string& unit, double count, const Timing& timing,
             const char* why_below_1 = "the machine may have been busy; as a rule it is above") const {
    line("speed", "%.1f million %s a second, %.2f times plain C (%.1f)", count / timing.kernel / 1e6, unit.c_str(),
         timing.ratio(), count / timing.plain / 1e6);
    if (timing.ratio() < 1) line("", "below 1: %s", why_below_1);
  }

  void written() const {
    line("written", "%s%s", shown(output).c_str(), picture.empty() ? "" : (", " + shown(picture)).c_str());
  }

 private:
  static const char* kind(const std::string& file) {
    return std::filesystem::path(file).extension() == ".wav" ? "a sound: 16-bit PCM WAV, mono or stereo"
                                                             : "a grey picture: binary PGM, 8 bits";
  }

  const char* name_;
  std::vector<std::pair<std::string, std::size_t>> checked_;
};

// Runs an example; what goes wrong ends as one line on the standard error stream and the exit status.
template <class Main>
int run(const About& about, int argc, const char* const* argv, Main&& main) {
  const auto fails = [&](const char* why, int status) {
    std::fflush(stdout);
    std::fprintf(stderr, "%s: %s\n", about.name, why);
    return status;
  };
  try {
    Program program(about, argc, argv);
    main(program);
    return 0;
  } catch (const Difference& difference) {
    return fails(difference.what(), 1);
  } catch (const std::bad_alloc&) {
    return fails("not enough memory", 2);
  } catch (const std::exception& failure) {
    return fails(failure.what(), 2);
  }
}

}  // namespace examples

#endif
