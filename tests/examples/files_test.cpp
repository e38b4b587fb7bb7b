// Sound and picture files, good and bad, and how files are written.
#include <gtest/gtest.h>

#include <csignal>
#include <functional>

#include <sys/resource.h>

#include "common/pgm.h"
#include "common/wav.h"
#include "support.h"

namespace {

using namespace examples;

const Wav STEREO = {44100, 2, {1, -2, 32767, -32768, 300, -400}};

std::string wav_complaint(const Bytes& bytes) {
  return complaint([&] { parse_wav(bytes, "x.wav"); });
}

TEST(Wav, ReadsWhatOthersWrite) {
  // fmt, a chunk of odd size that means nothing here, data of two mono frames, then more.
  const char header[] =
      "RIFF\x45\0\0\0WAVEfmt "
      "\x10\0\0\0\1\0\1\0\x40\x1f\0\0\x80\x3e\0\0\2\0\x10\0LIST\3\0\0\0abc\0data\4\0\0\0\xfe\xff\0\x7f"
      "tail\1\0\0\0z";
  const Wav mono = parse_wav(Bytes(header, header + sizeof header), "x.wav");
  EXPECT_EQ(mono.rate, 8000u);
  EXPECT_EQ(mono.channels, 1u);
  EXPECT_EQ(mono.samples, (std::vector<std::int16_t>{-2, 0x7f00}));

  const Wav back = parse_wav(wav_bytes(STEREO), "x.wav");
  EXPECT_EQ(back.samples, STEREO.samples);
  EXPECT_EQ(back.channel(1), (std::vector<std::int16_t>{-2, -32768, -400}));
}

TEST(Wav, TellsWhatIsWrong) {
  using Damage = std::function<void(Bytes&)>;
  const std::pair<const char*, Damage> cases[] = {
      {"not a WAV file", [](Bytes& b) { b.clear(); }},
      {"not a WAV file", [](Bytes& b) { b[3] = 'X'; }},
      {"compressed", [](Bytes& b) { b[20] = 85; }},
      {"compressed", [](Bytes& b) { b[20] = 0xfe, b[21] = 0xff; }},  // extensible, without room for its format
      {"8 bits", [](Bytes& b) { b[34] = 8; }},
      {"6 channels", [](Bytes& b) { b[22] = 6; }},
      {"damaged", [](Bytes& b) { b[32] = 3; }},
      {"damaged", [](Bytes& b) { b[24] = b[25] = 0; }},
      {"format chunk is too short", [](Bytes& b) { b[16] = 14; }},
      {"no format before the data", [](Bytes& b) { b[12] = 'g'; }},
      {"truncated", [](Bytes& b) { b[40] = b[41] = b[42] = b[43] = 0xff; }},
      {"no sound data", [](Bytes& b) { b[36] = 'D'; }},
      {"the last frame is not whole", [](Bytes& b) { b[40] = 10; }},
      {"holds no sound", [](Bytes& b) { b[40] = 0; }},
  };
  for (const auto& one : cases) {
    Bytes bytes = wav_bytes(STEREO);
    one.second(bytes);
    EXPECT_NE(wav_complaint(bytes).find(one.first), std::string::npos) << one.first << ": " << wav_complaint(bytes);
  }
}

TEST(Wav, ComplainsWhereverItIsCut) {
  const Bytes whole = wav_bytes(STEREO);
  for (std::size_t size = 0; size < whole.size(); ++size) {
    EXPECT_NE(wav_complaint(Bytes(whole.begin(), whole.begin() + static_cast<std::ptrdiff_t>(size))), "") << size;
  }
}

TEST(Pgm, ReadsItsHeaderAndTellsWhatIsWrong) {
  const auto parse = [](const std::string& text) { return parse_pgm(Bytes(text.begin(), text.end()), "x.pgm"); };
  const Picture picture = parse("P5 # made by hand\n2\n#\n3 255\n\nabcde");
  EXPECT_EQ(picture.width, 2);
  EXPECT_EQ(picture.height, 3);
  EXPECT_EQ(picture.pixels, (std::vector<std::uint8_t>{'\n', 'a', 'b', 'c', 'd', 'e'}));

  const std::pair<const char*, const char*> cases[] = {
      {"P2 2 3 255\nabcdef", "not a binary PGM"}, {"P5 2 x 255\nabcdef", "damaged"},
      {"P5 2 3 65535\nabcdef", "white is 65535"}, {"P5 0 3 255\n", "0 x 3"},
      {"P5 99999999999 3 255\n", "damaged"},      {"P5 2 3 255\nabcde", "5 of 6 pixels"}};
  for (const auto& one : cases) {
    const std::string told = complaint([&] { parse(one.first); });
    EXPECT_NE(told.find(one.second), std::string::npos) << one.first << ": " << told;
  }
}

TEST(Files, AreWrittenWholeOrNotAtAll) {
  const Directory directory;
  write_file(directory.file("a"), "old");
  write_file(directory.file("a"), "new");
  const Bytes read = read_file(directory.file("a"));
  EXPECT_EQ(std::string(read.begin(), read.end()), "new");

  EXPECT_NE(complaint([&] { write_file(directory.path(), "into a directory"); }), "");
  EXPECT_NE(complaint([&] { write_file(directory.file("none/b"), "x"); }), "");
  EXPECT_NE(complaint([&] { write_file("/dev/full", "x"); }), "");
  EXPECT_NE(complaint([&] { read_file(directory.path()); }), "");

  // A disk that is full in the middle of a file.
  struct rlimit unlimited;
  ASSERT_EQ(::getrlimit(RLIMIT_FSIZE, &unlimited), 0);
  struct rlimit few = unlimited;
  few.rlim_cur = 1000;
  std::signal(SIGXFSZ, SIG_IGN);
  ASSERT_EQ(::setrlimit(RLIMIT_FSIZE, &few), 0);
  const std::string told = complaint([&] { write_file(directory.file("a"), Bytes(100000)); });
  ASSERT_EQ(::setrlimit(RLIMIT_FSIZE, &unlimited), 0);
  EXPECT_NE(told, "");
  EXPECT_EQ(read_file(directory.file("a")), read);
  EXPECT_EQ(directory.names(), std::set<std::string>{"a"});
}

}  // namespace
