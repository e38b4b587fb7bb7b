// The threshold: its kernels and the program.
#include <gtest/gtest.h>

#include <random>

#include "common/pgm.h"
#include "support.h"
#include "threshold/threshold.h"

namespace {

using namespace examples;

// Every grey and counts around whole registers, with white behind the last pixel that must not count.
TEST(Threshold, KernelsAreExactForEveryLengthAndLevel) {
  std::mt19937 random(7);
  for (const int count : {1, 63, 64, 65, 128, 300}) {
    Bytes pixels(static_cast<std::size_t>(count + THRESHOLD_MARGIN), 255);
    for (int i = 0; i < count; ++i) pixels[static_cast<std::size_t>(i)] = static_cast<std::uint8_t>(random());
    for (int level = -1; level <= 255; ++level) {
      Part expected;
      for (int i = 0; i < count; ++i) {
        const int grey = pixels[static_cast<std::size_t>(i)];
        expected.pixels += grey > level ? 1 : 0;
        expected.sum += grey > level ? static_cast<unsigned>(grey) : 0;
      }
      const Part got = lighter(pixels.data(), count, level);
      ASSERT_EQ(got.pixels, expected.pixels) << count << " pixels, level " << level;
      ASSERT_EQ(got.sum, expected.sum) << count << " pixels, level " << level;
    }
  }
}

TEST(Threshold, PixelsMoveByTheShareOfTheirWay) {
  Bytes greys(256 + THRESHOLD_MARGIN), parted(greys.size());
  for (int grey = 0; grey < 256; ++grey) greys[static_cast<std::size_t>(grey)] = static_cast<std::uint8_t>(grey);
  for (const int level : {0, 100, 254, 255}) {
    for (int shift = 0; shift < 8; ++shift) {
      part(greys.data(), parted.data(), 256, level, shift);
      for (int grey = 0; grey < 256; ++grey) {
        const int end = grey > level ? 255 : 0;
        ASSERT_EQ(parted[static_cast<std::size_t>(grey)], grey + (end - grey) / (1 << shift))
            << "grey " << grey << ", level " << level << ", shift " << shift;
      }
    }
  }
}

// Two greys: the level lies midway between them, and the picture is black and white.
TEST(Threshold, ProgramFindsTheLevelBetweenTwoGreys) {
  const Directory directory;
  Picture two(7, 9);
  for (std::size_t i = 0; i < two.pixels.size(); ++i) two.pixels[i] = i % 3 ? 90 : 110;
  write_pgm(directory.file("two.pgm"), two);
  ASSERT_EQ(run_example(directory, "threshold", "--input two.pgm --output parted.pgm").status, 0);
  const Picture parted = read_pgm(directory.file("parted.pgm"));
  for (std::size_t i = 0; i < two.pixels.size(); ++i) ASSERT_EQ(parted.pixels[i], i % 3 ? 0 : 255) << i;
  const Outcome wrong = run_example(directory, "threshold", "--level 256");
  EXPECT_EQ(wrong.status, 2);
  EXPECT_NE(wrong.errors.find("--level"), std::string::npos) << wrong.errors;
}

}  // namespace
