// The threshold as kernels for the core: 64 pixels at a time, chosen by predicates.
#include <kastarri.h>
#include <kastarri/names.h>

#include "threshold/threshold.h"

Part lighter(const std::uint8_t* pixels, int count, int level) {
  const auto* in = reinterpret_cast<const qv_vec2Nx8U*>(pixels);
  const qv_vec2Nx8U one = 1;
  const qv_vec2Nx8U lowest = level + 1;
  Part part;
  if (level >= 255) return part;  // nothing is lighter than white, and a lane cannot hold 256
  for (int n = 0; n < count; n += 64) {
    qv_vec2Nx8U lane;
    qv_vec2Nx8U_loadip(lane, &in, sizeof lane);
    const vbool2N chosen = ZRA_ANDB2N(ZRA_GEU2NX8U(lane, lowest), ZRA_LTRS2N(count - n));
    part.pixels += ZRA_RADDU2NX8T(one, chosen)._[0];
    part.sum += ZRA_RADDU2NX8T(lane, chosen)._[0];
  }
  return part;
}

void part(const std::uint8_t* pixels, std::uint8_t* parted, int count, int level, int shift) {
  const auto* in = reinterpret_cast<const qv_vec2Nx8U*>(pixels);
  auto* out = reinterpret_cast<qv_vec2Nx8U*>(parted);
  const qv_vec2Nx8U highest = level;
  for (int n = 0; n < count; n += 64) {
    qv_vec2Nx8U lane;
    qv_vec2Nx8U_loadip(lane, &in, sizeof lane);
    const vbool2N light = ZRA_GTU2NX8U(lane, highest);
    // The distance to white, 255 - pixel, is the pixel with all bits turned; the distance to black is the pixel.
    qv_vec2Nx8U moved = ZRA_SUB2NX8U(lane, ZRA_SRLI2NX8U(lane, shift));
    ZRA_ADD2NX8UT(moved, lane, ZRA_SRLI2NX8U(ZRA_NOT2NX8U(lane), shift), light);
    qv_vec2Nx8U_storeip(moved, &out, sizeof moved);
  }
}
