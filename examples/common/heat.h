// Colours for numbers, from nearly black by violet and orange to nearly white: brighter is more, for every eye and on
// paper too.
#ifndef KASTARRI_EXAMPLES_HEAT_H
#define KASTARRI_EXAMPLES_HEAT_H

#include "common/png.h"

namespace examples {

inline std::array<Colour, 256> heat_colours() {
  static const Colour stops[] = {{0, 0, 4},      {59, 15, 112},   {140, 41, 129},
                                 {222, 73, 104}, {254, 159, 109}, {252, 253, 191}};
  std::array<Colour, 256> colours;
  for (std::size_t i = 0; i < 256; ++i) {
    const std::size_t below = std::min<std::size_t>(i / 51, 4), part = i - 51 * below;  // 255 is 5 * 51
    for (std::size_t c = 0; c < 3; ++c)
      colours[i][c] = static_cast<std::uint8_t>((stops[below][c] * (51 - part) + stops[below + 1][c] * part + 25) / 51);
  }
  return colours;
}

}  // namespace examples

#endif
