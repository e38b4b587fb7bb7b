// Counts the greys of a photograph and changes its gamma with the core's gathers and scatters, checks both
// against plain scalar code, tells how fast they are and draws the histogram before and after.
#include <kastarri.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <numeric>
#include <string>
#include <vector>

#include "common/options.h"
#include "common/pgm.h"
#include "common/progress.h"
#include "common/svg.h"
#include "common/timing.h"
#include "histogram/histogram.h"

namespace {

using namespace examples;
using Counts = std::vector<unsigned>;

struct Settings {
  std::string input, output, picture;
  double gamma;
};

Settings parse(int argc, char** argv) {
  Options options(argc, argv, "draws the histogram of a grey picture and changes its gamma");
  Settings s;
  s.input = options.path("input", EXAMPLE_DATA "/camera.pgm", "the picture: binary PGM, 8 bits");
  s.output = options.path("output", "gamma.pgm", "where the picture with the new gamma goes");
  s.picture = options.path("picture", "histogram.svg", "where the histogram goes");
  s.gamma = options.number("gamma", 1.8, 0.1, 10, "the exponent is 1 / gamma: above 1 brightens");
  options.finish();
  return s;
}

// 0 stays 0 and 255 stays 255; the entry after the last is read and not used.
std::vector<unsigned char> gamma_table(double gamma) {
  std::vector<unsigned char> table;
  for (int g = 0; g <= GREYS; ++g)
    table.push_back(
        static_cast<unsigned char>(std::min(255.0, std::floor(255 * std::pow(g / 255.0, 1 / gamma) + 0.5))));
  return table;
}

// Throws if what the kernel made differs from what the scalar version made.
template <class T>
void require_equal(const char* what, const std::vector<T>& got, const std::vector<T>& expected) {
  const auto differ = std::mismatch(expected.begin(), expected.end(), got.begin());
  if (differ.first == expected.end()) return;
  throw std::runtime_error(std::string(what) + " " + std::to_string(differ.first - expected.begin()) + " is " +
                           std::to_string(*differ.second) + ", and " + std::to_string(*differ.first) +
                           " in the scalar version");
}

class Greys {
 public:
  explicit Greys(const Picture& picture) : pixels_(picture.pixels), count_(static_cast<int>(picture.pixels.size())) {
    pixels_.resize(pixels_.size() + PIXEL_MARGIN);
  }

  Counts histogram() const {
    Counts counts(GREYS), expected(GREYS);
    count_greys(pixels_.data(), count_, counts.data());
    count_greys_reference(pixels_.data(), count_, expected.data());
    require_equal("the count of grey", counts, expected);
    return counts;
  }

  std::vector<unsigned char> looked_up(const std::vector<unsigned char>& table) const {
    std::vector<unsigned char> out(pixels_.size()), expected(static_cast<std::size_t>(count_));
    look_up(pixels_.data(), count_, table.data(), out.data());
    look_up_reference(pixels_.data(), count_, table.data(), expected.data());
    require_equal("pixel", out, expected);
    out.resize(expected.size());
    return out;
  }

  void tell_speed(const std::vector<unsigned char>& table) const {
    const int rounds = std::max(1, (1 << 20) / count_);
    const auto tell = [&](const char* what, auto kernel, auto scalar) {
      const auto repeat = [rounds](auto f) {
        return [=] {
          for (int i = 0; i < rounds; ++i) f();
        };
      };
      Progress progress("timing");
      const Timing timing = compare(11, repeat(kernel), repeat(scalar), [&](int i, int of) { progress.show(i, of); });
      std::printf("  %s %.0f million pixels a second, %.2f times the scalar version (%.0f)\n", what,
                  static_cast<double>(count_) * rounds / 1e6 / timing.kernel, timing.ratio(),
                  static_cast<double>(count_) * rounds / 1e6 / timing.scalar);
    };
    Counts counts(GREYS);
    std::vector<unsigned char> out(pixels_.size());
    tell(
        "histogram", [&] { count_greys(pixels_.data(), count_, counts.data()); },
        [&] { count_greys_reference(pixels_.data(), count_, counts.data()); });
    tell(
        "gamma    ", [&] { look_up(pixels_.data(), count_, table.data(), out.data()); },
        [&] { look_up_reference(pixels_.data(), count_, table.data(), out.data()); });
  }

 private:
  std::vector<unsigned char> pixels_;
  int count_;
};

void draw(const Settings& s, const Counts& before, const Counts& after) {
  std::vector<double> greys, was, is;
  const double pixels = static_cast<double>(std::accumulate(before.begin(), before.end(), 0u));
  for (std::size_t g = 0; g < GREYS; ++g) {
    greys.push_back(static_cast<double>(g));
    was.push_back(100 * before[g] / pixels);
    is.push_back(100 * after[g] / pixels);
  }
  const std::string file = s.input.substr(s.input.find_last_of('/') + 1);
  Plot plot("Histogram before and after the gamma", file + ", gamma " + Options::brief(s.gamma));
  plot.x = {"grey (0 = black, 255 = white)", -1, 256};
  plot.y = {"share of the pixels (%)", 0,
            1.05 * std::max(*std::max_element(was.begin(), was.end()), *std::max_element(is.begin(), is.end()))};
  plot.bars("before", greys, was);
  plot.curve("after", greys, is);
  write_svg(s.picture, plot);
}

int draw_histogram(int argc, char** argv) {
  const Settings s = parse(argc, argv);
  Picture picture = read_pgm(s.input);
  const std::vector<unsigned char> table = gamma_table(s.gamma);
  const Greys greys(picture);
  const Counts before = greys.histogram();
  picture.pixels = greys.looked_up(table);
  const Counts after = Greys(picture).histogram();

  std::printf("%s: %d x %d pixels, gamma %s\n", s.input.c_str(), picture.width, picture.height,
              Options::brief(s.gamma).c_str());
  std::printf("  target    %s\n", cstub_Km_ZNB_Orbis_R5_64k_target());
  std::printf("  check     all %d counts and all %zu pixels equal those of the scalar version\n", GREYS,
              picture.pixels.size());
  greys.tell_speed(table);
  write_pgm(s.output, picture);
  draw(s, before, after);
  std::printf("  written   %s, %s\n", s.output.c_str(), s.picture.c_str());
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run("histogram", [&] { return draw_histogram(argc, argv); });
}
