// The command line of the examples.
#include <gtest/gtest.h>

#include "common/options.h"
#include "support.h"

namespace {

using namespace examples;

struct Settings {
  int taps;
  double cutoff;
  std::string type;
};

Settings parse(std::vector<const char*> words) {
  words.insert(words.begin(), "program");
  Options options(static_cast<int>(words.size()), words.data(), "is tested");
  Settings s;
  s.taps = options.integer("taps", 16, 2, 512, "a whole number");
  s.cutoff = options.number("cutoff", 0.25, -1, 1, "a number");
  s.type = options.choice("type", "low", {"low", "high"}, "a word");
  options.finish();
  return s;
}

TEST(Options, AreReadInBothForms) {
  const Settings s = parse({"--cutoff", "-0.5", "--taps=512", "--type", "high"});
  EXPECT_EQ(s.taps, 512);
  EXPECT_EQ(s.cutoff, -0.5);
  EXPECT_EQ(s.type, "high");
  EXPECT_EQ(parse({}).taps, 16);
}

TEST(Options, TellWhatIsWrong) {
  const std::pair<std::vector<const char*>, const char*> cases[] = {
      {{"--tops", "3"}, "unknown option --tops"},
      {{"--tops"}, "unknown option --tops"},
      {{"file.wav"}, "not an option"},
      {{"--taps"}, "--taps needs a value"},
      {{"--taps", "513"}, "between 2 and 512"},
      {{"--taps", "1"}, "between 2 and 512"},
      {{"--taps", "16.5"}, "not a whole number"},
      {{"--taps", "12x"}, "not a number"},
      {{"--taps", ""}, "not a number"},
      {{"--cutoff", "nan"}, "between -1 and 1"},
      {{"--cutoff", "1e999"}, "between -1 and 1"},
      {{"--type", "notch"}, "it can be low|high"},
      {{"--taps", "3", "--taps", "4"}, "given twice"},
  };
  for (const auto& one : cases) {
    const std::string told = complaint([&] { parse(one.first); });
    EXPECT_NE(told.find(one.second), std::string::npos) << one.second << ": " << told;
  }
}

}  // namespace
