// The helpers of gather and scatter that take a mask an element and a control word.
#include "kastarri/gather.h"

#include "memory/gather.h"

namespace {

// What a control word says.
struct Control {
  explicit Control(unsigned bits) : path(bits >> 4 & 3), bytes((bits >> 6 & 3) == 0), increment((bits & 15) == 6) {}
  unsigned path;   // 0: 32 elements of at most 16 bits, 1: 16 of 32 bits, else none
  bool bytes;      // of the first path: 8 bits
  bool increment;  // of a scatter
};

// A disabled element's mask is 0, and so is what it gathers.
template <class L, int Bits>
void gather_masked(const void* base, const unsigned* offsets, const unsigned* masks, unsigned* out) {
  const Read<L> mask(masks);
  word enabled = 0;
  for (int i = 0; i < L::count; ++i) enabled |= word{mask[i] != 0} << i;
  alignas(64) word units[16];
  word nowhere = 0;
  gather<L, Bits>(base, offsets, elements(base, nowhere, enabled), units);
  lanes<L::count>(
      Write<L>(out), [](word unit, word mask_lane) { return unit & mask_lane; }, Read<L>(units), mask);
}

// Elements of 8 bits are read in 16-bit units whatever becomes of the upper byte.
template <class L, class Element>
void scatter_masked(const void* base, const unsigned* offsets, const unsigned* masks, bool increment,
                    const unsigned* data) {
  using Unit = typename L::container;
  const Read<L> mask(masks), lane(data), offset(offsets);
  for (int i = 0; i < L::count; ++i) {
    if (mask[i] == 0) continue;
    const Distance place = distance(offset[i]);
    const Unit old = element<Unit>(base, place);
    asm volatile("" : : "r"(old));
    const auto merged = increment ? old + (mask[i] & 1u) : old ^ (mask[i] & (lane[i] ^ old));
    element<Element>(base, place) = static_cast<Element>(merged);
  }
}

}  // namespace

void cstub_Km_ZNB_Orbis_R5_64k_do_gathera(const void* base, const unsigned* offsets, const unsigned* masks,
                                          unsigned control, unsigned* out) {
  const Control c(control);
  if (c.path == 0 && c.bytes) gather_masked<u16x32, 8>(base, offsets, masks, out);
  if (c.path == 0 && !c.bytes) gather_masked<u16x32, 16>(base, offsets, masks, out);
  if (c.path == 1) gather_masked<u32x16, 32>(base, offsets, masks, out);
}

void cstub_Km_ZNB_Orbis_R5_64k_do_scatter(const void* base, const unsigned* offsets, const unsigned* masks,
                                          unsigned control, const unsigned* data) {
  const Control c(control);
  if (c.path == 0 && c.bytes) scatter_masked<u16x32, std::uint8_t>(base, offsets, masks, c.increment, data);
  if (c.path == 0 && !c.bytes) scatter_masked<u16x32, std::uint16_t>(base, offsets, masks, c.increment, data);
  if (c.path == 1) scatter_masked<u32x16, std::uint32_t>(base, offsets, masks, c.increment, data);
}
