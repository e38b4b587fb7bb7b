// Gather and scatter: elements at a base address plus a byte offset each, unsigned 32-bit, wrapping.
#ifndef KASTARRI_MEMORY_GATHER_H
#define KASTARRI_MEMORY_GATHER_H

#include <immintrin.h>

#include "frame/lanes.h"

namespace {

// The elements' addresses. A disabled element gets that of a word of no meaning, so that nothing branches
// on the predicate and memory is left alone all the same.
template <class O>
class ElementAddresses {
 public:
  static constexpr int count = O::count;

  // Enabled are the elements whose predicate bit is 1, or whose mask is not 0, or all: Same(true).
  template <class PredicateUnit>
  ElementAddresses(const void* base, const Read<O>& offsets, const PredicateUnit* predicate) {
    LaneMask<O::bits, count> mask;
    mask.expand(predicate);
    fill(base, offsets, mask.lane);
  }
  ElementAddresses(const void* base, const Read<O>& offsets, const Read<O>& masks) { fill(base, offsets, masks); }
  ElementAddresses(const void* base, const Read<O>& offsets, Same<bool> all) { fill(base, offsets, all); }
  ElementAddresses(const ElementAddresses&) = delete;

  // The element at address i, as long as a Unit.
  template <class Unit>
  in_memory<Unit>& element(int i) const {
    return *reinterpret_cast<in_memory<Unit>*>(at_[i]);
  }

 private:
  template <class Enabled>
  void fill(const void* base, const Read<O>& offsets, const Enabled& enabled) {
    const auto from = reinterpret_cast<std::uintptr_t>(base);
    const auto nowhere = reinterpret_cast<std::uintptr_t>(&nowhere_);
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < count; ++i) at_[i] = enabled[i] ? from + offsets[i] : nowhere;
  }

  alignas(64) std::uintptr_t at_[count];
  word nowhere_ = 0;
};

// Eight 16-bit elements or four 32-bit ones from index i on. The compiler must not see what becomes of
// them: an 8-bit element is read with the byte after it, used or not.
template <class Addresses>
inline __m128i fetch(std::integral_constant<int, 32>, const Addresses& from, int i) {
  const auto unit = [&](int k) { return static_cast<short>(from.template element<std::uint16_t>(i + k)); };
  __m128i units = _mm_set_epi16(unit(7), unit(6), unit(5), unit(4), unit(3), unit(2), unit(1), unit(0));
  asm("" : "+x"(units));
  return units;
}
template <class Addresses>
inline __m128i fetch(std::integral_constant<int, 16>, const Addresses& from, int i) {
  const auto unit = [&](int k) { return static_cast<int>(from.template element<std::uint32_t>(i + k)); };
  return _mm_set_epi32(unit(3), unit(2), unit(1), unit(0));
}

// Gathers whole elements, of 16 bits from 32 offsets, of 32 bits from 16. A disabled one reads 0.
template <class Addresses>
inline void gather(const Addresses& from, word* out) {
  constexpr std::integral_constant<int, Addresses::count> path;
  constexpr int step = Addresses::count / 4;
  store_quarters(out, fetch(path, from, 0), fetch(path, from, step), fetch(path, from, 2 * step),
                 fetch(path, from, 3 * step));
}

// Each element in ascending order becomes rule(element, i): a Unit is read, a Written of it written back.
template <class Unit, class Written, class Addresses, class Rule>
inline void scatter(const Addresses& to, Rule rule) {
  for (int i = 0; i < Addresses::count; ++i) {
    const Unit old = to.template element<Unit>(i);
    if (sizeof(Written) < sizeof(Unit)) asm volatile("" : : "r"(old));  // read, whatever the rule makes of it
    to.template element<Written>(i) = static_cast<Written>(rule(old, i));
  }
}

}  // namespace

#endif
