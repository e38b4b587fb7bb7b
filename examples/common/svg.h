// Plots as SVG pictures: axes, a grid, curves, bars, marks and a legend.
//
//   Plot plot("Spectrum", "guitar.wav, before and after");
//   plot.x = {"frequency (kHz)", 0, 22};
//   plot.y = {"power (dB)", -120, 0};
//   plot.curve("before", xs, ys);
//   write_svg("spectrum.svg", {plot});  // several stand one below another
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
#include "common/heat.h"

namespace examples {

struct Axis {
  std::string label;
  double low = 0;
  double high = 1;
  bool logarithmic = false;
};

class Plot {
 public:
  explicit Plot(std::string title, std::string subtitle = "")
      : title_(std::move(title)), subtitle_(std::move(subtitle)) {}

  Axis x, y;
  double height = 540;

  // A grey line through the points, behind the curves.
  void background(const std::string& name, const std::vector<double>& xs, const std::vector<double>& ys,
                  double width = 1.6) {
    series_.push_back({name, xs, ys, Kind::background, width});
  }
  // A line through the points.
  void curve(const std::string& name, const std::vector<double>& xs, const std::vector<double>& ys) {
    series_.push_back({name, xs, ys, Kind::line, 1.6});
  }
  // A bar at each x from the bottom of the plot to y.
  void bars(const std::string& name, const std::vector<double>& xs, const std::vector<double>& ys) {
    series_.push_back({name, xs, ys, Kind::bar, 0});
  }
  // A picture that fills the plot, its greys from 0 to 255 as colours for numbers from low to high, with a key.
  void picture(const std::string& name, const Picture& greys, double low, double high) {
    picture_ = "data:image/png;base64," + base64(png_bytes(greys, heat_colours()));
    series_.push_back({name, {low, high}, {}, Kind::picture, 0});
  }
  // A dashed upright line with a word at its top.
  void mark(double at, const std::string& word) { marks_.emplace_back(at, word); }

  // The picture as a document. Its title and description are for those who do not see it.
  static std::string svg(const std::vector<Plot>& plots) {
    std::string title, description, drawings;
    double used = 0;  // of the height
    for (std::size_t i = 0; i < plots.size(); ++i) {
      const Plot& plot = plots[i];
      title += (i ? "; " : "") + plot.title_;
      description += (i ? " " : "") + plot.description();
      add(drawings, "<g transform='translate(0 %g)'>\n", used);
      plot.draw(drawings, i);
      drawings += "</g>\n";
      used += plot.height;
    }
    std::string out;
    add(out, "<svg xmlns='http://www.w3.org/2000/svg' viewBox='0 0 %g %g' width='%g' height='%g' role='img' ", WIDTH,
        used, WIDTH, used);
    out +=
        "aria-labelledby='title description' font-family='system-ui, \"DejaVu Sans\", Helvetica, Arial, sans-serif'>\n";
    out += "<title id='title'>" + escaped(title) + "</title>\n";
    out += "<desc id='description'>" + escaped(description) + "</desc>\n";
    add(out, "<rect width='%g' height='%g' fill='#ffffff'/>\n", WIDTH, used);
    return out + drawings + "</svg>\n";
  }

 private:
  enum class Kind { background, bar, line, picture };
  struct Series {
    std::string name;
    std::vector<double> xs, ys;
    Kind kind;
    double width;  // of its line
  };

  static constexpr double WIDTH = 960;
  static constexpr double LEFT = 78, RIGHT = 930;
  double top() const { return series_.size() > 1 ? 104 : 76; }  // a single series needs no legend
  double bottom() const { return height - 62; }

  std::string description() const {
    std::string names;
    for (const Series& s : series_) names += (names.empty() ? "" : ", ") + s.name;
    return subtitle_ + ". Up: " + y.label + "; across: " + x.label + ". Drawn are: " + names + ".";
  }

  // `number` tells the plots of a document apart.
  void draw(std::string& out, std::size_t number) const {
    add(out, "<clipPath id='inside%zu'><rect x='%g' y='%g' width='%g' height='%g'/></clipPath>\n", number, LEFT, top(),
        RIGHT - LEFT, bottom() - top());
    text(out, LEFT, 34, "start", "font-size='20' font-weight='600' fill='#1f2933'", title_);
    text(out, LEFT, 56, "start", "font-size='13' fill='#616e7c'", subtitle_);
    draw_axes(out);
    add(out, "<g clip-path='url(#inside%zu)'>\n", number);
    if (!picture_.empty()) draw_picture(out);
    for (const Kind kind : {Kind::background, Kind::bar, Kind::line}) {
      for (std::size_t i = 0; i < series_.size(); ++i) {
        if (series_[i].kind == kind) kind == Kind::bar ? draw_bars(out, i) : draw_curve(out, i);
      }
    }
    add(out, "</g>\n");
    draw_marks(out);
    draw_legend(out);
    draw_key(out, number);
  }

  // Colours that people with any colour vision tell apart (Okabe and Ito).
  const char* colour(std::size_t which) const {
    static const char* const colours[] = {"#0072b2", "#d55e00", "#009e73", "#cc79a7", "#e69f00", "#56b4e9"};
    if (series_[which].kind == Kind::background) return "#b8c0ca";
    std::size_t before = 0;
    for (std::size_t i = 0; i < which; ++i) before += series_[i].kind != Kind::background ? 1 : 0;
    return colours[before % 6];
  }
  static std::size_t bounded(std::size_t have, std::size_t want) { return std::min(have, want); }

  double across(double value) const {
    const auto scaled = [&](double v) { return x.logarithmic ? std::log(std::max(v, x.low / 2)) : v; };
    return LEFT + (scaled(value) - scaled(x.low)) / (scaled(x.high) - scaled(x.low)) * (RIGHT - LEFT);
  }
  double up(double value) const {
    const double far = y.high - y.low;  // a spike beyond the frame is cut there, whatever its size
    const double v = std::isfinite(value) ? std::min(std::max(value, y.low - far), y.high + far) : y.low - far;
    return bottom() - (v - y.low) / far * (bottom() - top());
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

  // Round numbers within the axis: about `wanted` of them, or 1, 2 and 5 times the powers of ten.
  static std::vector<double> ticks(const Axis& axis, int wanted) {
    std::vector<double> result;
    if (axis.logarithmic) {
      for (double power = std::pow(10.0, std::floor(std::log10(axis.low))); power <= axis.high; power *= 10) {
        for (const double factor : {1.0, 2.0, 5.0}) {
          if (factor * power >= axis.low && factor * power <= axis.high) result.push_back(factor * power);
        }
      }
      return result;
    }
    const double raw = (axis.high - axis.low) / wanted;
    const double power = std::pow(10.0, std::floor(std::log10(raw)));
    double step = 10 * power;
    for (const double candidate : {5.0, 2.0, 1.0}) {
      if (candidate * power >= raw * 0.75) step = candidate * power;
    }
    for (double k = std::ceil(axis.low / step - 1e-9); k * step <= axis.high + step * 1e-9; ++k)
      result.push_back(std::fabs(k) < 0.5 ? 0.0 : k * step);
    return result;
  }
  static std::string tick_label(double value) {
    char label[32];
    std::snprintf(label, sizeof label, "%g", value);
    return label[0] == '-' ? "\u2212" + std::string(label + 1) : label;
  }

  void draw_axes(std::string& out) const {
    const char* const grid = "stroke='#e4e7eb' stroke-width='1'";
    const char* const small = "font-size='12' fill='#52606d'";
    const char* const label = "font-size='13' fill='#323f4b'";
    for (const double tick : ticks(x, 11)) {
      const double at = across(tick);
      add(out, "<line x1='%.1f' y1='%g' x2='%.1f' y2='%g' %s/>\n", at, top(), at, bottom(), grid);
      text(out, at, bottom() + 20, "middle", small, tick_label(tick));
    }
    for (const double tick : ticks(y, height < 400 ? 4 : 7)) {
      const double at = up(tick);
      add(out, "<line x1='%g' y1='%.1f' x2='%g' y2='%.1f' %s/>\n", LEFT, at, RIGHT, at, grid);
      text(out, LEFT - 10, at + 4, "end", small, tick_label(tick));
    }
    add(out, "<path d='M%g %gV%gH%g' fill='none' stroke='#7b8794' stroke-width='1.2'/>\n", LEFT, top(), bottom(),
        RIGHT);
    text(out, (LEFT + RIGHT) / 2, bottom() + 46, "middle", label, x.label);
    add(out, "<g transform='translate(24 %g) rotate(-90)'>", (top() + bottom()) / 2);
    text(out, 0, 0, "middle", label, y.label);
    add(out, "</g>\n");
  }

  void draw_curve(std::string& out, std::size_t which) const {
    const Series& s = series_[which];
    add(out, "<path fill='none' stroke='%s' stroke-width='%g' stroke-linejoin='round' stroke-opacity='0.9' d='",
        colour(which), s.width);
    double last = -WIDTH;
    for (std::size_t i = 0; i < bounded(s.xs.size(), s.ys.size()); ++i) {
      const double at = across(s.xs[i]);
      if (at - last < 0.5) continue;  // a logarithmic axis crowds its high end: no one sees half a pixel
      add(out, "%c%.1f %.1f", i == 0 ? 'M' : 'L', at, up(s.ys[i]));
      last = at;
    }
    out += "'/>\n";
  }

  void draw_bars(std::string& out, std::size_t which) const {
    const Series& s = series_[which];
    const double step = s.xs.size() > 1 ? std::fabs(across(s.xs[1]) - across(s.xs[0])) : (RIGHT - LEFT) / 4;
    add(out, "<path fill='%s' d='", colour(which));
    for (std::size_t i = 0; i < bounded(s.xs.size(), s.ys.size()); ++i) {
      const double left = across(s.xs[i]) - step * 0.45;
      add(out, "M%.2f %.1fV%.1fh%.2fV%.1fz", left, bottom(), up(s.ys[i]), step * 0.9, bottom());
    }
    out += "'/>\n";
  }

  void draw_picture(std::string& out) const {
    add(out, "<image x='%g' y='%g' width='%g' height='%g' preserveAspectRatio='none' href='", LEFT, top(), RIGHT - LEFT,
        bottom() - top());
    out += picture_ + "'/>\n";
  }

  // What the colours of a picture stand for: a strip of them above its right end, with the numbers at the ends.
  void draw_key(std::string& out, std::size_t plot) const {
    constexpr double FROM = RIGHT - 150, HIGH = 22, WORDS = HIGH + 11;
    for (const Series& s : series_) {
      if (s.kind != Kind::picture) continue;
      add(out, "<linearGradient id='heat%zu'>", plot);
      for (int i = 0; i <= 8; ++i) {
        const Colour c = heat_colours()[static_cast<std::size_t>(i * 255 / 8)];
        add(out, "<stop offset='%g' stop-color='#%02x%02x%02x'/>", i / 8.0, c[0], c[1], c[2]);
      }
      add(out, "</linearGradient><rect x='%g' y='%g' width='110' height='12' fill='url(#heat%zu)'/>\n", FROM, HIGH,
          plot);
      const char* const small = "font-size='12' fill='#52606d'";
      text(out, FROM - 6, WORDS, "end", small, s.name + "  " + tick_label(s.xs.front()));
      text(out, FROM + 116, WORDS, "start", small, tick_label(s.xs.back()));
    }
  }

  // Words of neighbours stand on two lines, so that close marks can be read.
  void draw_marks(std::string& out) const {
    for (std::size_t i = 0; i < marks_.size(); ++i) {
      const double at = across(marks_[i].first);
      add(out,
          "<line x1='%.1f' y1='%g' x2='%.1f' y2='%g' stroke='#323f4b' stroke-width='1.2' stroke-dasharray='5 4'/>\n",
          at, top(), at, bottom());
      const bool right = at > (LEFT + RIGHT) / 2;
      text(out, right ? at - 6 : at + 6, top() + (i % 2 == 0 ? 14 : 32), right ? "end" : "start",
           "font-size='12' fill='#323f4b'", marks_[i].second);
    }
  }

  void draw_legend(std::string& out) const {
    if (series_.size() < 2) return;
    double at = LEFT;
    for (std::size_t i = 0; i < series_.size(); ++i) {
      const Series& s = series_[i];
      add(out, "<rect x='%.1f' y='%g' width='18' height='%d' rx='1.5' fill='%s'/>\n", at,
          s.kind == Kind::bar ? 76.0 : 81.0, s.kind == Kind::bar ? 12 : 3, colour(i));
      text(out, at + 25, 87, "start", "font-size='13' fill='#323f4b'", s.name);
      at += 25 + 7.6 * static_cast<double>(s.name.size()) + 26;
    }
  }

  std::string title_, subtitle_, picture_;
  std::vector<Series> series_;
  std::vector<std::pair<double, std::string>> marks_;
};

inline void write_svg(const std::string& path, const std::vector<Plot>& plots) { write_file(path, Plot::svg(plots)); }

}  // namespace examples

#endif
