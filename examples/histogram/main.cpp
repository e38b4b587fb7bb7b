// Counts the greys of a photograph with a scatter and changes its gamma with a gather, checks both against plain
// C and draws the histogram before and after.
#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "common/pgm.h"
#include "common/program.h"
#include "common/svg.h"
#include "histogram/histogram.h"

namespace {

using namespace examples;
using Counts = std::vector<unsigned>;
using Table = std::vector<unsigned char>;

// 255 (g / 255)^(1 / gamma) for each grey g, rounded: 0 stays 0 and 255 stays 255. The entry after the last is
// read by the kernel and not used.
Table gamma_table(double gamma) {
  Table table;
  for (int g = 0; g <= GREYS; ++g)
    table.push_back(
        static_cast<unsigned char>(std::min(255.0, std::floor(255 * std::pow(g / 255.0, 1 / gamma) + 0.5))));
  return table;
}

// The pixels of a picture, and what the kernels make of them.
class Greys {
 public:
  Greys(Program& program, const Picture& picture)
      : program_(program), pixels_(picture.pixels), count_(static_cast<int>(picture.pixels.size())) {
    pixels_.resize(pixels_.size() + PIXEL_MARGIN);
  }

  Counts histogram() const {
    Counts counts(GREYS), plain(GREYS);
    count_greys(pixels_.data(), count_, counts.data());
    count_greys_reference(pixels_.data(), count_, plain.data());
    program_.equal("counts", counts, plain);
    return counts;
  }

  Bytes looked_up(const Table& table) const {
    Bytes out(pixels_.size()), plain(static_cast<std::size_t>(count_));
    look_up(pixels_.data(), count_, table.data(), out.data());
    look_up_reference(pixels_.data(), count_, table.data(), plain.data());
    out.resize(plain.size());
    program_.equal("pixels", out, plain);
    return out;
  }

  void tell_speed(const Table& table) const {
    // A small picture is gone through several times, so that it takes long enough.
    const int rounds = std::max(1, (1 << 20) / count_);
    const auto tell = [&](const char* what, auto kernel, auto plain, const char* why_below_1) {
      const auto repeat = [rounds](auto f) {
        return [=] {
          for (int i = 0; i < rounds; ++i) f();
        };
      };
      program_.speed(what, static_cast<double>(count_) * rounds, compare(11, repeat(kernel), repeat(plain)),
                     why_below_1);
    };
    Counts counts(GREYS);
    Bytes out(pixels_.size());
    tell(
        "pixels counted", [&] { count_greys(pixels_.data(), count_, counts.data()); },
        [&] { count_greys_reference(pixels_.data(), count_, counts.data()); },
        "a scatter goes from lane to lane, as plain C does, and loads and stores registers besides");
    tell(
        "pixels looked up", [&] { look_up(pixels_.data(), count_, table.data(), out.data()); },
        [&] { look_up_reference(pixels_.data(), count_, table.data(), out.data()); },
        "a gather goes from lane to lane, as plain C does, and loads and stores registers besides");
  }

 private:
  Program& program_;
  Bytes pixels_;
  int count_;
};

Plot histogram_plot(const std::string& title, const std::string& subtitle, const Counts& counts, double most) {
  std::vector<double> greys, shares;
  double pixels = 0;
  for (const unsigned count : counts) pixels += count;
  for (const unsigned count : counts) {
    greys.push_back(static_cast<double>(greys.size()));
    shares.push_back(100 * count / pixels);
  }
  Plot plot(title, subtitle);
  plot.height = 300;
  plot.x = {"grey (0 = black, 255 = white)", -1, 256};
  plot.y = {"share of the pixels (%)", 0, 1.05 * 100 * most / pixels};
  plot.bars("each grey", greys, shares);
  return plot;
}

void draw(const Program& program, const std::string& gamma, const Counts& before, const Counts& after) {
  const double most =
      std::max(*std::max_element(before.begin(), before.end()), *std::max_element(after.begin(), after.end()));
  write_svg(program.picture, {histogram_plot("Histogram before", program.input_name(), before, most),
                              histogram_plot("Histogram after", gamma, after, most)});
}

void change_gamma(Program& program) {
  const double gamma = program.options.number("gamma", 1.8, 0.1, 10, "the exponent is 1 / gamma: above 1 brightens");
  program.options.finish();
  Picture picture = read_pgm(program.input);
  const std::string what = "gamma " + Options::brief(gamma);
  program.heading(what, describe(picture));

  const Table table = gamma_table(gamma);
  const Greys greys(program, picture);
  const Counts before = greys.histogram();
  picture.pixels = greys.looked_up(table);
  const Counts after = Greys(program, picture).histogram();
  program.checked();
  greys.tell_speed(table);
  write_pgm(program.output, picture);
  draw(program, what, before, after);
  program.written();
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run({"histogram", "draws the histogram of a grey picture and changes its gamma", "camera.pgm",
                        "histogram.pgm", "histogram.svg"},
                       argc, argv, change_gamma);
}
