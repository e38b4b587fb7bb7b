// Plots as SVG pictures: axes, a grid, curves, bars, marks and a legend.
//
//   Plot plot("Spectrum", "guitar.wav, before and after");
//   plot.x = {"frequency (kHz)", 0, 22};
//   plot.y = {"power (dB)", -120, 0};
//   plot.curve("before", xs, ys);
//   write_file("spectrum.svg", plot.svg());
#ifndef KASTARRI_EXAMPLES_SVG_H
#define KASTARRI_EXAMPLES_SVG_H

#include <algorithm>
#include <cmath>
#include <cstdarg>
#include <cstdio>
#include <string>
#include <utility>
#include <vector>

#include "common/files.h"

namespace examples {

struct Axis {
  std::string label;
  double low = 0;
  double high = 1;
  std::vector<std::pair<double, std::string>> names = {};  // ticks with names of their own; none: round numbers
};

class Plot {
 public:
  explicit Plot(std::string title, std::string subtitle = "")
      : title_(std::move(title)), subtitle_(std::move(subtitle)) {}

  Axis x, y;

  // A thin grey line through the points, behind the curves.
  void background(const std::string& name, const std::vector<double>& xs, const std::vector<double>& ys) {
    series_.push_back({name, xs, ys, Kind::background});
  }
  // A line through the points.
  void curve(const std::string& name, const std::vector<double>& xs, const std::vector<double>& ys) {
    series_.push_back({name, xs, ys, Kind::line});
  }
  // A bar at each x from the bottom of the plot (or zero, where it is inside) to y.
  void bars(const std::string& name, const std::vector<double>& xs, const std::vector<double>& ys) {
    series_.push_back({name, xs, ys, Kind::bar});
  }
  // A dashed upright line with a word at its top.
  void mark(double at, const std::string& word) { marks_.emplace_back(at, word); }

  std::string svg() const {
    std::string out;
    add(out, "<svg xmlns='http://www.w3.org/2000/svg' viewBox='0 0 %g %g' width='%g' height='%g' font-family='%s'>\n",
        WIDTH, HEIGHT, WIDTH, HEIGHT, "system-ui, \"DejaVu Sans\", Helvetica, Arial, sans-serif");
    add(out, "<rect width='%g' height='%g' fill='#ffffff'/>\n", WIDTH, HEIGHT);
    add(out, "<clipPath id='inside'><rect x='%g' y='%g' width='%g' height='%g'/></clipPath>\n", LEFT, TOP, RIGHT - LEFT,
        BOTTOM - TOP);
    text(out, LEFT, 34, "start", "font-size='20' font-weight='600' fill='#1f2933'", title_);
    text(out, LEFT, 56, "start", "font-size='13' fill='#616e7c'", subtitle_);
    draw_axes(out);
    add(out, "<g clip-path='url(#inside)'>\n");
    for (const Kind kind : {Kind::background, Kind::bar, Kind::line}) {
      for (std::size_t i = 0; i < series_.size(); ++i) {
        if (series_[i].kind == kind) kind == Kind::bar ? draw_bars(out, i) : draw_curve(out, i);
      }
    }
    add(out, "</g>\n");
    draw_marks(out);
    draw_legend(out);
    return out + "</svg>\n";
  }

 private:
  enum class Kind { background, bar, line };
  struct Series {
    std::string name;
    std::vector<double> xs, ys;
    Kind kind;
  };

  static constexpr double WIDTH = 960, HEIGHT = 540;
  static constexpr double LEFT = 78, RIGHT = 930, TOP = 104, BOTTOM = 478;

  // Colours that people with any colour vision tell apart (Okabe and Ito).
  const char* colour(std::size_t which) const {
    static const char* const colours[] = {"#0072b2", "#d55e00", "#009e73", "#cc79a7", "#e69f00", "#56b4e9"};
    if (series_[which].kind == Kind::background) return "#b8c0ca";
    return colours[count(which, [](Kind kind) { return kind != Kind::background; }) % 6];
  }
  // How many of the first series are of a kind.
  template <class Is>
  std::size_t count(std::size_t first, Is is) const {
    std::size_t found = 0;
    for (std::size_t i = 0; i < first; ++i) found += is(series_[i].kind) ? 1 : 0;
    return found;
  }
  static std::size_t bounded(std::size_t have, std::size_t want) { return std::min(have, want); }

  double across(double value) const { return LEFT + (value - x.low) / (x.high - x.low) * (RIGHT - LEFT); }
  double up(double value) const {
    const double far = y.high - y.low;  // a spike beyond the frame is cut there, whatever its size
    const double v = std::isfinite(value) ? std::min(std::max(value, y.low - far), y.high + far) : y.low - far;
    return BOTTOM - (v - y.low) / far * (BOTTOM - TOP);
  }

  [[gnu::format(printf, 2, 3)]] static void add(std::string& out, const char* format, ...) {
    char line[512];
    va_list arguments;
    va_start(arguments, format);
    const int length = std::vsnprintf(line, sizeof line, format, arguments);
    va_end(arguments);
    out.append(line, bounded(static_cast<std::size_t>(length < 0 ? 0 : length), sizeof line - 1));
  }
  static std::string escaped(const std::string& words) {
    std::string out;
    for (const char c : words) {
      if (c == '&')
        out += "&amp;";
      else if (c == '<')
        out += "&lt;";
      else if (c == '>')
        out += "&gt;";
      else if (static_cast<unsigned char>(c) >= ' ')
        out += c;
    }
    return out;
  }
  static void text(std::string& out, double at_x, double at_y, const char* anchor, const char* style,
                   const std::string& words) {
    add(out, "<text x='%.1f' y='%.1f' text-anchor='%s' %s>", at_x, at_y, anchor, style);
    out += escaped(words) + "</text>\n";
  }

  // Round numbers, about `wanted` of them, within the axis.
  static std::vector<std::pair<double, std::string>> ticks(const Axis& axis, int wanted) {
    if (!axis.names.empty()) return axis.names;
    const double raw = (axis.high - axis.low) / wanted;
    const double power = std::pow(10.0, std::floor(std::log10(raw)));
    double step = 10 * power;
    for (const double candidate : {5.0, 2.0, 1.0}) {
      if (candidate * power >= raw * 0.75) step = candidate * power;
    }
    std::vector<std::pair<double, std::string>> result;
    for (double k = std::ceil(axis.low / step - 1e-9); k * step <= axis.high + step * 1e-9; ++k) {
      char label[32];
      std::snprintf(label, sizeof label, "%g", std::fabs(k) < 0.5 ? 0.0 : k * step);
      result.emplace_back(k * step, label[0] == '-' ? "\u2212" + std::string(label + 1) : label);
    }
    return result;
  }

  void draw_axes(std::string& out) const {
    const char* const grid = "stroke='#e4e7eb' stroke-width='1'";
    const char* const small = "font-size='12' fill='#52606d'";
    const char* const label = "font-size='13' fill='#323f4b'";
    for (const auto& tick : ticks(x, 11)) {
      const double at = across(tick.first);
      if (x.names.empty()) add(out, "<line x1='%.1f' y1='%g' x2='%.1f' y2='%g' %s/>\n", at, TOP, at, BOTTOM, grid);
      text(out, at, BOTTOM + 20, "middle", small, tick.second);
    }
    for (const auto& tick : ticks(y, 7)) {
      const double at = up(tick.first);
      add(out, "<line x1='%g' y1='%.1f' x2='%g' y2='%.1f' %s/>\n", LEFT, at, RIGHT, at, grid);
      text(out, LEFT - 10, at + 4, "end", small, tick.second);
    }
    add(out, "<path d='M%g %gV%gH%g' fill='none' stroke='#7b8794' stroke-width='1.2'/>\n", LEFT, TOP, BOTTOM, RIGHT);
    text(out, (LEFT + RIGHT) / 2, BOTTOM + 46, "middle", label, x.label);
    add(out, "<g transform='translate(24 %g) rotate(-90)'>", (TOP + BOTTOM) / 2);
    text(out, 0, 0, "middle", label, y.label);
    add(out, "</g>\n");
  }

  void draw_curve(std::string& out, std::size_t which) const {
    const Series& s = series_[which];
    add(out, "<path fill='none' stroke='%s' stroke-width='1.6' stroke-linejoin='round' stroke-opacity='0.9' d='",
        colour(which));
    for (std::size_t i = 0; i < bounded(s.xs.size(), s.ys.size()); ++i) {
      add(out, "%c%.1f %.1f", i == 0 ? 'M' : 'L', across(s.xs[i]), up(s.ys[i]));
    }
    out += "'/>\n";
  }

  // Bars of several series stand side by side.
  void draw_bars(std::string& out, std::size_t which) const {
    const Series& s = series_[which];
    const auto is_bar = [](Kind kind) { return kind == Kind::bar; };
    const auto groups = static_cast<double>(count(series_.size(), is_bar));
    const auto place = static_cast<double>(count(which, is_bar));
    const double step = s.xs.size() > 1 ? std::fabs(across(s.xs[1]) - across(s.xs[0])) : (RIGHT - LEFT) / 4;
    const double width = step * 0.8 / groups;
    const double base = up(std::min(std::max(0.0, y.low), y.high));
    for (std::size_t i = 0; i < bounded(s.xs.size(), s.ys.size()); ++i) {
      const double end = up(s.ys[i]);
      add(out, "<rect x='%.1f' y='%.1f' width='%.1f' height='%.1f' fill='%s' fill-opacity='0.85'/>\n",
          across(s.xs[i]) - step * 0.4 + place * width, std::min(base, end), width, std::fabs(end - base),
          colour(which));
    }
  }

  // Words of neighbours stand on two lines, so that close marks can be read.
  void draw_marks(std::string& out) const {
    for (std::size_t i = 0; i < marks_.size(); ++i) {
      const double at = across(marks_[i].first);
      add(out,
          "<line x1='%.1f' y1='%g' x2='%.1f' y2='%g' stroke='#323f4b' stroke-width='1.2' stroke-dasharray='5 4'/>\n",
          at, TOP, at, BOTTOM);
      const bool right = at > (LEFT + RIGHT) / 2;
      text(out, right ? at - 6 : at + 6, TOP + (i % 2 == 0 ? 14 : 32), right ? "end" : "start",
           "font-size='12' fill='#323f4b'", marks_[i].second);
    }
  }

  void draw_legend(std::string& out) const {
    double at = LEFT;
    for (std::size_t i = 0; i < series_.size(); ++i) {
      const Series& s = series_[i];
      add(out, "<rect x='%.1f' y='%g' width='18' height='%d' rx='1.5' fill='%s'/>\n", at,
          s.kind == Kind::bar ? 76.0 : 81.0, s.kind == Kind::bar ? 12 : 3, colour(i));
      text(out, at + 25, 87, "start", "font-size='13' fill='#323f4b'", s.name);
      at += 25 + 7.6 * static_cast<double>(s.name.size()) + 26;
    }
  }

  std::string title_, subtitle_;
  std::vector<Series> series_;
  std::vector<std::pair<double, std::string>> marks_;
};

inline void write_svg(const std::string& path, const Plot& plot) { write_file(path, plot.svg()); }

}  // namespace examples

#endif
