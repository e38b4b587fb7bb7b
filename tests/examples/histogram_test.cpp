// The histogram and the look-up: their kernels and the program.
#include <gtest/gtest.h>

#include <map>
#include <random>

#include "common/pgm.h"
#include "histogram/histogram.h"
#include "support.h"

namespace {

using namespace examples;

TEST(Histogram, KernelsAreExactForEveryLengthAndWriteNothingElse) {
  std::mt19937 random(11);
  std::vector<unsigned char> table(GREYS + 1);
  for (auto& entry : table) entry = static_cast<unsigned char>(random());
  // The long ones have more pixels of one grey than 16 bits count.
  for (const int count : {1, 2, 31, 32, 33, 64, 1000, 65503, 65504, 65505, 200001}) {
    std::vector<unsigned char> pixels(static_cast<std::size_t>(count + PIXEL_MARGIN));
    for (auto& pixel : pixels) pixel = static_cast<unsigned char>(count > 65000 && random() % 64 ? 77 : random());
    std::map<int, unsigned> expected;
    for (int i = 0; i < count; ++i) ++expected[pixels[static_cast<std::size_t>(i)]];
    std::vector<unsigned> counts(GREYS, 9);
    count_greys(pixels.data(), count, counts.data());
    for (int g = 0; g < GREYS; ++g)
      ASSERT_EQ(counts[static_cast<std::size_t>(g)], expected[g]) << count << ", grey " << g;

    std::vector<unsigned char> out(pixels.size() + 8, 0xA5);
    look_up(pixels.data(), count, table.data(), out.data() + 4);
    for (int i = -4; i < count + PIXEL_MARGIN; ++i) {
      const unsigned char want = i < 0 || i >= count ? 0xA5 : table[pixels[static_cast<std::size_t>(i)]];
      ASSERT_EQ(out[static_cast<std::size_t>(i + 4)], want) << count << " pixels, at " << i;
    }
  }
}

TEST(Histogram, ProgramChangesTheGamma) {
  const Directory directory;
  Picture picture(5, 3);
  picture.pixels = {0, 255, 64, 64, 64, 1, 2, 3, 4, 5, 250, 251, 252, 253, 254};
  write_pgm(directory.file("in.pgm"), picture);
  const Outcome run = run_example(directory, "histogram", "--input in.pgm --gamma 2");
  EXPECT_EQ(run.status, 0) << run.errors;
  const Picture after = read_pgm(directory.file("gamma.pgm"));
  EXPECT_EQ(after.pixels[0], 0);
  EXPECT_EQ(after.pixels[1], 255);
  EXPECT_EQ(after.pixels[2], 128);  // the root of a quarter is a half
  const Outcome refused = run_example(directory, "histogram", "--input none.pgm");
  EXPECT_EQ(refused.status, 2);
  EXPECT_NE(refused.errors.find("none.pgm: No such file"), std::string::npos) << refused.errors;
}

}  // namespace
