// Grey pictures: binary PGM (P5), 8 bits a pixel.
#ifndef KASTARRI_EXAMPLES_PGM_H
#define KASTARRI_EXAMPLES_PGM_H

#include <algorithm>
#include <cctype>
#include <cstdint>
#include <string>
#include <vector>

#include "common/files.h"

namespace examples {

struct Picture {
  int width = 0;
  int height = 0;
  std::vector<std::uint8_t> pixels;  // row by row from the top

  Picture() = default;
  Picture(int columns, int rows)
      : width(columns), height(rows), pixels(static_cast<std::size_t>(columns) * static_cast<std::size_t>(rows)) {}
  std::uint8_t* row(int y) { return pixels.data() + static_cast<std::size_t>(y) * static_cast<std::size_t>(width); }
  const std::uint8_t* row(int y) const { return const_cast<Picture*>(this)->row(y); }
};

constexpr int PICTURE_MAX = 16384;  // pixels a side

// The picture in the bytes of a PGM file; `name` is what messages call it.
inline Picture parse_pgm(const Bytes& bytes, const std::string& name) {
  std::size_t at = 2;
  if (bytes.size() < 3 || bytes[0] != 'P' || bytes[1] != '5') throw Failure(name + ": not a binary PGM (P5) picture");
  const auto damaged = [&] { return Failure(name + ": the PGM header is damaged"); };
  // A number of the header, with white space and # comments before it.
  const auto number = [&] {
    while (at < bytes.size() && (std::isspace(bytes[at]) || bytes[at] == '#')) {
      if (bytes[at] == '#') {
        while (at < bytes.size() && bytes[at] != '\n') ++at;
      } else {
        ++at;
      }
    }
    if (at == bytes.size() || !std::isdigit(bytes[at])) throw damaged();
    int value = 0;
    for (; at < bytes.size() && std::isdigit(bytes[at]); ++at) {
      value = value * 10 + (bytes[at] - '0');
      if (value > 65535) throw damaged();
    }
    return value;
  };
  const int width = number();
  const int height = number();
  const int white = number();
  if (at == bytes.size() || !std::isspace(bytes[at++])) throw damaged();
  if (width < 1 || height < 1 || width > PICTURE_MAX || height > PICTURE_MAX) {
    throw Failure(name + ": " + std::to_string(width) + " x " + std::to_string(height) + " pixels; 1 to " +
                  std::to_string(PICTURE_MAX) + " a side are taken");
  }
  if (white != 255) throw Failure(name + ": white is " + std::to_string(white) + "; 8-bit pictures (255) are taken");
  const std::size_t needed = static_cast<std::size_t>(width) * static_cast<std::size_t>(height);
  if (bytes.size() - at < needed) {
    throw Failure(name + ": truncated: " + std::to_string(bytes.size() - at) + " of " + std::to_string(needed) +
                  " pixels");
  }
  Picture picture(width, height);
  std::copy_n(bytes.begin() + static_cast<std::ptrdiff_t>(at), needed, picture.pixels.begin());
  return picture;
}

inline Picture read_pgm(const std::string& path) { return parse_pgm(read_file(path), path); }

// As in "512 x 512 pixels".
inline std::string describe(const Picture& picture) {
  return std::to_string(picture.width) + " x " + std::to_string(picture.height) + " pixels";
}

inline void write_pgm(const std::string& path, const Picture& picture) {
  const std::string header = "P5\n" + std::to_string(picture.width) + " " + std::to_string(picture.height) + "\n255\n";
  Bytes bytes(header.begin(), header.end());
  bytes.insert(bytes.end(), picture.pixels.begin(), picture.pixels.end());
  write_file(path, bytes);
}

}  // namespace examples

#endif
