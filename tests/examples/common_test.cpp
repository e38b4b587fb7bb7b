// What the examples share: the command line, the check of kernels, sounds and pictures, and how files are written.
#include <gtest/gtest.h>

#include <csignal>
#include <functional>

#include <sys/resource.h>

#include "common/pgm.h"
#include "common/program.h"
#include "common/wav.h"
#include "support.h"

namespace {

using namespace examples;

std::string parsed(std::vector<const char*> words) {
  words.insert(words.begin(), "program");
  Options options(static_cast<int>(words.size()), words.data(), "is tested");
  const std::string type = options.choice("type", "low", {"low", "high"}, "a word");
  const int taps = options.integer("taps", 16, 2, 512, "a whole number");
  const double cutoff = options.number("cutoff", 0.25, -1, 1, "a number");
  options.finish();
  return type + " " + std::to_string(taps) + " " + Options::brief(cutoff);
}

TEST(Options, AreReadOrRefused) {
  EXPECT_EQ(parsed({}), "low 16 0.25");
  EXPECT_EQ(parsed({"--cutoff", "-0.5", "--taps=512", "--type", "high"}), "high 512 -0.5");
  const std::pair<std::vector<const char*>, const char*> refused[] = {
      {{"--tops"}, "unknown option --tops"},       {{"file.wav"}, "not an option"},
      {{"--taps"}, "--taps needs a value"},        {{"--taps", "513"}, "between 2 and 512"},
      {{"--taps", "16.5"}, "not a whole number"},  {{"--taps", ""}, "not a number"},
      {{"--type", "notch"}, "it can be low|high"}, {{"--cutoff", "nan"}, "between -1 and 1"},
  };
  for (const auto& one : refused) expect_complaint([&] { parsed(one.first); }, one.second);
}

// A kernel that differs anywhere ends the program with 1, and what is wrong with an input with 2.
TEST(Program, EndsByWhatItsKernelMade) {
  const About about = {"tested", "is tested", "guitar.wav", "out.wav", nullptr};
  const char* const words[] = {"program"};
  const std::vector<short> plain = {1, 2, 3};
  const auto status_of = [&](const std::vector<short>& kernel) {
    return run(about, 1, words, [&](Program& program) { program.equal("samples", kernel, plain); });
  };
  EXPECT_EQ(status_of({1, 2, 3}), 0);
  EXPECT_EQ(status_of({1, 2, 4}), 1);
  EXPECT_EQ(status_of({1, 2}), 1);
  EXPECT_EQ(status_of({1, 2, 3, 0}), 1);
  EXPECT_EQ(run(about, 1, words, [](Program&) { throw Failure("no such file"); }), 2);
}

const Wav STEREO = {44100, 2, {1, -2, 32767, -32768, 300, -400}};

TEST(Wav, ReadsWhatOthersWrite) {
  // fmt, a chunk of odd size that means nothing here, data of two mono frames, then more.
  const char header[] =
      "RIFF\x45\0\0\0WAVEfmt "
      "\x10\0\0\0\1\0\1\0\x40\x1f\0\0\x80\x3e\0\0\2\0\x10\0LIST\3\0\0\0abc\0data\4\0\0\0\xfe\xff\0\x7f"
      "tail\1\0\0\0z";
  const Wav mono = parse_wav(Bytes(header, header + sizeof header), "x.wav");
  EXPECT_EQ(describe(mono), "0.00 s, 8000 Hz, mono");
  EXPECT_EQ(mono.samples, (std::vector<std::int16_t>{-2, 0x7f00}));
  EXPECT_EQ(parse_wav(wav_bytes(STEREO), "x.wav").channel(1), (std::vector<std::int16_t>{-2, -32768, -400}));
}

TEST(Wav, TellsWhatIsWrong) {
  using Damage = std::function<void(Bytes&)>;
  const std::pair<const char*, Damage> cases[] = {
      {"not a WAV file", [](Bytes& b) { b[3] = 'X'; }},
      {"compressed", [](Bytes& b) { b[20] = 0xfe, b[21] = 0xff; }},  // extensible, without room for its format
      {"6 channels", [](Bytes& b) { b[22] = 6; }},
      {"damaged", [](Bytes& b) { b[24] = b[25] = 0; }},
      {"format chunk is too short", [](Bytes& b) { b[16] = 14; }},
      {"no format before the data", [](Bytes& b) { b[12] = 'g'; }},
      {"the last frame is not whole", [](Bytes& b) { b[40] = 10; }},
      {"holds no sound", [](Bytes& b) { b[40] = 0; }},
  };
  for (const auto& one : cases) {
    Bytes bytes = wav_bytes(STEREO);
    one.second(bytes);
    expect_complaint([&] { parse_wav(bytes, "x.wav"); }, one.first);
  }
  for (Bytes cut = wav_bytes(STEREO); !cut.empty();) {
    cut.pop_back();
    expect_complaint([&] { parse_wav(cut, "x.wav"); }, "x.wav: ");
  }
}

TEST(Pgm, ReadsItsHeaderAndTellsWhatIsWrong) {
  const auto parse = [](const std::string& text) { return parse_pgm(Bytes(text.begin(), text.end()), "x.pgm"); };
  const Picture picture = parse("P5 # made by hand\n2\n#\n3 255\n\nabcde");
  EXPECT_EQ(describe(picture), "2 x 3 pixels");
  EXPECT_EQ(picture.pixels, (Bytes{'\n', 'a', 'b', 'c', 'd', 'e'}));

  const std::pair<const char*, const char*> cases[] = {
      {"P2 2 3 255\nabcdef", "not a binary PGM"}, {"P5 2 x 255\nabcdef", "damaged"},
      {"P5 2 3 65535\nabcdef", "white is 65535"}, {"P5 0 3 255\n", "0 x 3"},
      {"P5 99999999999 3 255\n", "damaged"},      {"P5 2 3 255\nabcde", "5 of 6 pixels"}};
  for (const auto& one : cases) expect_complaint([&] { parse(one.first); }, one.second);
}

TEST(Files, AreWrittenWholeOrNotAtAll) {
  const Directory directory;
  const std::string path = directory.file("a");
  write_file(path, "old");
  write_file(path, "new");
  const Bytes read = read_file(path);
  EXPECT_EQ(std::string(read.begin(), read.end()), "new");

  expect_complaint([&] { write_file(directory.file("none/b"), "x"); }, "No such file");
  expect_complaint([&] { write_file("/dev/full", "x"); }, "No space left");

  // A disk that is full in the middle of a file.
  struct rlimit unlimited;
  ASSERT_EQ(::getrlimit(RLIMIT_FSIZE, &unlimited), 0);
  const struct rlimit few = {1000, unlimited.rlim_max};
  std::signal(SIGXFSZ, SIG_IGN);
  ASSERT_EQ(::setrlimit(RLIMIT_FSIZE, &few), 0);
  expect_complaint([&] { write_file(path, Bytes(100000)); }, "cannot be written");
  ASSERT_EQ(::setrlimit(RLIMIT_FSIZE, &unlimited), 0);
  EXPECT_EQ(read_file(path), read);
  EXPECT_EQ(directory.names(), std::set<std::string>{"a"});
}

}  // namespace
