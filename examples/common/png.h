// Pictures of up to 256 colours as PNG, for documents that hold their pictures. Nothing is compressed: there is no
// library to link, and a picture of half a million pixels is half a megabyte.
#ifndef KASTARRI_EXAMPLES_PNG_H
#define KASTARRI_EXAMPLES_PNG_H

#include <algorithm>
#include <array>
#include <string>

#include "common/pgm.h"

namespace examples {
namespace png_detail {

inline void number(Bytes& to, std::uint32_t value) {  // the high byte first
  for (int shift = 24; shift >= 0; shift -= 8) to.push_back(static_cast<std::uint8_t>(value >> shift));
}

// The remainder by the polynomial of CRC-32, bits in the order of the wire.
inline std::uint32_t remainder(const std::uint8_t* at, std::size_t size) {
  std::uint32_t rest = 0xffffffff;
  for (std::size_t i = 0; i < size; ++i) {
    rest ^= at[i];
    for (int bit = 0; bit < 8; ++bit) rest = rest >> 1 ^ (rest & 1 ? 0xedb88320 : 0);
  }
  return ~rest;
}

inline std::uint32_t adler(const Bytes& bytes) {
  std::uint32_t low = 1, high = 0;
  for (const std::uint8_t byte : bytes) low = (low + byte) % 65521, high = (high + low) % 65521;
  return high << 16 | low;
}

inline void chunk(Bytes& png, const char* name, const Bytes& data) {
  number(png, static_cast<std::uint32_t>(data.size()));
  const std::size_t start = png.size();
  png.insert(png.end(), name, name + 4);
  png.insert(png.end(), data.begin(), data.end());
  number(png, remainder(&png[start], png.size() - start));
}

// A zlib stream of blocks that are stored as they are, each at most 65535 bytes.
inline Bytes stored(const Bytes& data) {
  Bytes stream = {0x78, 0x01};
  for (std::size_t at = 0; at < data.size(); at += 65535) {
    const std::size_t size = std::min<std::size_t>(65535, data.size() - at);
    const bool last = at + size == data.size();
    for (const std::size_t value :
         {last ? std::size_t{1} : std::size_t{0}, size & 255, size >> 8, ~size & 255, ~size >> 8 & 255})
      stream.push_back(static_cast<std::uint8_t>(value));
    stream.insert(stream.end(), data.begin() + static_cast<std::ptrdiff_t>(at),
                  data.begin() + static_cast<std::ptrdiff_t>(at + size));
  }
  number(stream, adler(data));
  return stream;
}

}  // namespace png_detail

using Colour = std::array<std::uint8_t, 3>;  // red, green, blue

// Pixel value v has colour v of the 256.
inline Bytes png_bytes(const Picture& picture, const std::array<Colour, 256>& colours) {
  using namespace png_detail;
  Bytes png = {0x89, 'P', 'N', 'G', '\r', '\n', 0x1a, '\n'}, head, palette, rows;
  number(head, static_cast<std::uint32_t>(picture.width));
  number(head, static_cast<std::uint32_t>(picture.height));
  head.insert(head.end(), {8, 3, 0, 0, 0});  // 8 bits, colours by their number
  for (const Colour& colour : colours) palette.insert(palette.end(), colour.begin(), colour.end());
  for (int y = 0; y < picture.height; ++y) {
    rows.push_back(0);  // no filter
    rows.insert(rows.end(), picture.row(y), picture.row(y) + picture.width);
  }
  chunk(png, "IHDR", head);
  chunk(png, "PLTE", palette);
  chunk(png, "IDAT", stored(rows));
  chunk(png, "IEND", {});
  return png;
}

// Bytes as text, six bits a letter, as addresses of the form data:...;base64 have them.
inline std::string base64(const Bytes& bytes) {
  static const char letters[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  std::string text;
  for (std::size_t i = 0; i < bytes.size(); i += 3) {
    const std::size_t left = std::min<std::size_t>(3, bytes.size() - i);
    std::uint32_t three = 0;
    for (std::size_t k = 0; k < 3; ++k) three = three << 8 | (k < left ? bytes[i + k] : 0u);
    for (std::size_t k = 0; k < 4; ++k) text += k <= left ? letters[three >> (18 - 6 * k) & 63] : '=';
  }
  return text;
}

}  // namespace examples

#endif
