// The command line: --name value or --name=value. An option is told by asking for it:
//
//   Options options(argc, argv, "filters a sound");
//   const int taps = options.integer("taps", 64, 2, 512, "length of the filter");
//   options.finish();  // answers --help, refuses what nobody asked for
#ifndef KASTARRI_EXAMPLES_OPTIONS_H
#define KASTARRI_EXAMPLES_OPTIONS_H

#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <map>
#include <string>
#include <vector>

#include "common/failure.h"

namespace examples {

class Options {
 public:
  Options(int argc, const char* const* argv, std::string purpose) : purpose_(std::move(purpose)), program_(argv[0]) {
    for (int i = 1; i < argc; ++i) {
      std::string name = argv[i];
      if (name == "--help" || name == "-h") {
        help_ = true;
        continue;
      }
      if (name.compare(0, 2, "--") != 0)
        throw Failure("'" + name + "' is not an option (options are --name value; see --help)");
      name.erase(0, 2);
      std::string value;
      const std::size_t equals = name.find('=');
      if (equals != std::string::npos) {
        value = name.substr(equals + 1);
        name.erase(equals);
      } else if (i + 1 < argc) {
        value = argv[++i];
      } else {
        missing_ = name;  // known only when all options are: an unknown one is told as unknown
      }
      if (!given_.emplace(name, value).second) throw Failure("--" + name + " is given twice");
    }
  }

  std::string path(const char* name, const std::string& fallback, const char* meaning) {
    const std::string path = value(name, fallback, "FILE", meaning);
    if (path.empty() && !help_) throw Failure(std::string("--") + name + " needs a file name");
    return path;
  }
  std::string choice(const char* name, const std::string& fallback, const std::vector<std::string>& choices,
                     const char* meaning) {
    std::string all;
    for (const auto& one : choices) all += (all.empty() ? "" : "|") + one;
    const std::string chosen = value(name, fallback, all, meaning);
    for (const auto& one : choices) {
      if (one == chosen) return chosen;
    }
    throw Failure(std::string("--") + name + " is '" + chosen + "'; it can be " + all);
  }
  double number(const char* name, double fallback, double low, double high, const char* meaning) {
    const std::string given = value(name, brief(fallback), brief(low) + ".." + brief(high), meaning);
    char* end = nullptr;
    const double number = std::strtod(given.c_str(), &end);
    if (given.empty() || *end != '\0') throw Failure(std::string("--") + name + " is '" + given + "', not a number");
    if (!(number >= low && number <= high)) {
      throw Failure(std::string("--") + name + " is " + given + "; it must lie between " + brief(low) + " and " +
                    brief(high));
    }
    return number;
  }
  int integer(const char* name, int fallback, int low, int high, const char* meaning) {
    const double value = number(name, fallback, low, high, meaning);
    if (value != std::floor(value))
      throw Failure(std::string("--") + name + " is " + brief(value) + ", not a whole number");
    return static_cast<int>(value);
  }
  bool given(const char* name) const { return given_.count(name) != 0; }

  void finish() const {
    for (const auto& option : given_) {
      if (!known_.count(option.first)) throw Failure("unknown option --" + option.first + " (see --help)");
    }
    if (!missing_.empty()) throw Failure("--" + missing_ + " needs a value");
    if (!help_) return;
    std::printf("%s: %s\n\n%s", program_.c_str(), purpose_.c_str(), help_text_.c_str());
    std::exit(0);
  }

  static std::string brief(double number) {
    char text[32];
    std::snprintf(text, sizeof text, "%.10g", number);
    return text;
  }

 private:
  std::string value(const std::string& name, const std::string& fallback, const std::string& form,
                    const char* meaning) {
    known_[name] = true;
    help_text_ +=
        "  --" + name + " " + form + "\n        " + meaning + (fallback.empty() ? "" : " (" + fallback + ")") + "\n";
    const auto found = given_.find(name);
    return found == given_.end() || help_ || name == missing_ ? fallback : found->second;
  }

  std::string purpose_, program_, help_text_, missing_;
  std::map<std::string, std::string> given_;
  std::map<std::string, bool> known_;
  bool help_ = false;
};

}  // namespace examples

#endif
