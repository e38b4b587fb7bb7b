// Gather and scatter: elements at a base address plus a byte offset each, unsigned 32-bit, wrapping.
#ifndef KASTARRI_MEMORY_GATHER_H
#define KASTARRI_MEMORY_GATHER_H

#include <immintrin.h>

#include "frame/lanes.h"

// Elements are taken one after the other: what is left to save is the counting.
#ifdef __clang__
#define KASTARRI_UNROLLED _Pragma("clang loop unroll_count(8)")
#else
#define KASTARRI_UNROLLED _Pragma("GCC unroll 8")
#endif

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
    LaneMask<8 * sizeof(std::uintptr_t), count> mask;
    mask.expand(predicate);
    fill(base, offsets, [&](int i) { return mask.lane[i]; });
  }
  ElementAddresses(const void* base, const Read<O>& offsets, const Read<O>& masks) {
    fill(base, offsets, [&](int i) { return masks[i] ? ~std::uintptr_t{0} : std::uintptr_t{0}; });
  }
  ElementAddresses(const void* base, const Read<O>& offsets, Same<bool>) {
    fill(base, offsets, [](int) { return ~std::uintptr_t{0}; });
  }
  ElementAddresses(const ElementAddresses&) = delete;

  // Has the addresses in memory, to be read one by one: compilers would rather take vectors apart, which
  // serves gathers well and scatters badly.
  void settle() { asm("" : "+m"(at_)); }

  // The element at address i, as long as a Unit.
  template <class Unit>
  in_memory<Unit>& element(int i) const {
    return *reinterpret_cast<in_memory<Unit>*>(at_[i]);
  }

 private:
  // An element's mask is all ones, or 0 when it is disabled.
  template <class MaskOf>
  void fill(const void* base, const Read<O>& offsets, MaskOf mask_of) {
    const auto nowhere = reinterpret_cast<std::uintptr_t>(&nowhere_);
    const auto from = reinterpret_cast<std::uintptr_t>(base) - nowhere;
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < count; ++i) {
      const std::uintptr_t there = from + offsets[i];
      at_[i] = nowhere + (there & mask_of(i));
    }
  }

  alignas(64) std::uintptr_t at_[count];
  word nowhere_ = 0;
};

// Eight 16-bit elements or four 32-bit ones from index i on. The compiler must not see what becomes of
// them: an 8-bit element is read with the byte after it, used or not.
inline __m128i fetch(const ElementAddresses<u16x32>& from, int i) {
  __m128i units = _mm_setzero_si128();
#define KASTARRI_INSERT(K) units = _mm_insert_epi16(units, from.element<std::int16_t>(i + K), K);
  KASTARRI_INSERT(0)
  KASTARRI_INSERT(1)
  KASTARRI_INSERT(2)
  KASTARRI_INSERT(3)
  KASTARRI_INSERT(4)
  KASTARRI_INSERT(5)
  KASTARRI_INSERT(6)
  KASTARRI_INSERT(7)
#undef KASTARRI_INSERT
  asm("" : "+x"(units));
  return units;
}
inline __m128i fetch(const ElementAddresses<u32x16>& from, int i) {
  const auto unit = [&](int k) { return from.element<std::int32_t>(i + k); };
  return _mm_set_epi32(unit(3), unit(2), unit(1), unit(0));
}

// 64 bytes from four quarters, stored in the width in which lanes are read back, so that the store forwards
// to the load.
inline void store_quarters(void* to, __m128i q0, __m128i q1, __m128i q2, __m128i q3) {
#if defined __AVX512BW__
  const __m512i low = _mm512_castsi256_si512(_mm256_set_m128i(q1, q0));
  // The form with a mask of all ones: with the other the compiler warns of its own header.
  _mm512_storeu_si512(to, _mm512_maskz_inserti64x4(0xFF, low, _mm256_set_m128i(q3, q2), 1));
#elif defined __AVX2__
  auto* half = static_cast<__m256i*>(to);
  _mm256_storeu_si256(half, _mm256_set_m128i(q1, q0));
  _mm256_storeu_si256(half + 1, _mm256_set_m128i(q3, q2));
#else
  auto* quarter = static_cast<__m128i*>(to);
  _mm_storeu_si128(quarter, q0);
  _mm_storeu_si128(quarter + 1, q1);
  _mm_storeu_si128(quarter + 2, q2);
  _mm_storeu_si128(quarter + 3, q3);
#endif
}

// Gathers whole elements, of 16 bits from 32 offsets, of 32 bits from 16. A disabled one reads 0.
template <class O>
inline void gather(const ElementAddresses<O>& from, word* out) {
  constexpr int step = O::count / 4;
  store_quarters(out, fetch(from, 0), fetch(from, step), fetch(from, 2 * step), fetch(from, 3 * step));
}

// Each element, in ascending order, becomes value(i). The byte after an 8-bit element is read.
template <class Element, class O, class Value>
inline void scatter(ElementAddresses<O>&& to, Value value) {
  to.settle();
  KASTARRI_UNROLLED
  for (int i = 0; i < O::count; ++i) {
    in_memory<Element>& element = to.template element<Element>(i);
    if constexpr (sizeof(Element) == 1) asm volatile("" : : "q"((&element)[1]));
    element = static_cast<Element>(value(i));
  }
}

// Each element, in ascending order, is read as a unit of the offsets' width and becomes rule(unit, i).
template <class Element, class O, class Rule>
inline void modify(ElementAddresses<O>&& to, Rule rule) {
  to.settle();
  KASTARRI_UNROLLED
  for (int i = 0; i < O::count; ++i) {
    using Unit = typename O::container;
    const Unit unit = to.template element<Unit>(i);
    to.template element<Element>(i) = static_cast<Element>(rule(unit, i));
  }
}

}  // namespace

#endif
