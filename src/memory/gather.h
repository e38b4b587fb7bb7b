// Gather and scatter: elements at a base address plus a byte offset each, wrapping. Offsets of 32 bits are signed,
// those of 16 bits are not.
#ifndef KASTARRI_MEMORY_GATHER_H
#define KASTARRI_MEMORY_GATHER_H

#include <cstring>
#include <utility>

#include "frame/intrinsics.h"
#include "frame/lanes.h"

namespace {

// What is added to the base for an offset, which may have no more bits than a word: -4 as a word is 2^32 - 4, which
// compilers would make a distance of 64 bits without a sign and without a warning. Hence a type of its own.
enum class Distance : std::uintptr_t {};

inline Distance distance(word offset) {
  return Distance(static_cast<std::uintptr_t>(static_cast<std::int32_t>(offset)));
}

template <class Unit>
inline in_memory<Unit>& element(const void* base, Distance from_base) {
  return *reinterpret_cast<in_memory<Unit>*>(reinterpret_cast<std::uintptr_t>(base) +
                                             static_cast<std::uintptr_t>(from_base));
}

// The same pointer, from which compilers cannot tell what it points to. Inlined into a kernel they know the array
// behind a base, and take no distance from it to lead to another object: the word that disabled elements are looked for
// in.
template <class M>
inline M* anywhere(M* base) {
  asm("" : "+r"(base));
  return base;
}

// Which elements there are: all, or those that a predicate enables.
struct EveryElement {
  Distance at(word offset, int) const { return distance(offset); }
};

// A disabled element is looked for in a word of the library's own: its offset is replaced by the distance from the base
// to that word. So nothing branches on the predicate, and the program's memory is left alone all the same. Offsets are
// chosen one at a time, so that the first load need not wait until all offsets have been.
class EnabledElements {
 public:
  EnabledElements(const void* base, word& nowhere, word predicate)
      : away_(Distance(reinterpret_cast<std::uintptr_t>(&nowhere) - reinterpret_cast<std::uintptr_t>(base))),
        predicate_(predicate) {
    asm("" : "+m"(nowhere));  // has to lie in memory: compilers do not see that it is read through another pointer
  }

  // The distance of element i where its offset is given.
  Distance at(word offset, int i) const {
    Distance own = distance(offset);
    asm("" : "+r"(own));  // in a register already, so that compilers choose by a conditional move, not a branch
    return (predicate_ >> i & 1) != 0 ? own : away_;
  }

 private:
  Distance away_;
  word predicate_;
};

// What `nowhere` holds is what disabled elements are gathered as.
inline EveryElement elements(const void*, word&) { return {}; }
inline EnabledElements elements(const void* base, word& nowhere, word predicate) {
  return EnabledElements(base, nowhere, predicate);
}

// --- Gathers ----------------------------------------------------------------------------------------

// The offset of element i. Of four offsets of 16 bits two are loaded as one word and taken apart, two one by one: that
// shares the work between the processor's loads and its shifts.
template <class O>
inline word offset(const void* offsets, int i) {
  if (O::bits == 32 || i % 4 > 1) return Read<O>(offsets)[i];
  const word own_and_next = Read<u32x16>(offsets)[i / 2];
  return i % 2 == 0 ? own_and_next & 0xFFFF : own_and_next >> 16;
}

// A block of elements from number First on, the low Bits of each.
template <class O, int Bits, int First, class Which, std::size_t... I>
inline __m128i fetch(const void* base, const void* offsets, Which which, std::index_sequence<I...>) {
  const auto place = [=](int i) { return which.at(offset<O>(offsets, First + i), First + i); };
  if constexpr (Bits == 32) {
    const __m128i units[] = {_mm_cvtsi32_si128(element<std::int32_t>(base, place(I)))...};
    return _mm_unpacklo_epi64(_mm_unpacklo_epi32(units[0], units[1]), _mm_unpacklo_epi32(units[2], units[3]));
  } else {
    __m128i units = _mm_setzero_si128();
    ((units = _mm_insert_epi16(units, element<std::int16_t>(base, place(I)), I)), ...);
    asm("" : "+x"(units));  // of an 8-bit element the byte after it is read, used or not
    if constexpr (Bits == 8) units = _mm_and_si128(units, _mm_set1_epi16(0xFF));
    return units;
  }
}

// Gathers 32 elements of 16 or 8 bits or 16 of 32 bits into units of the offsets' width. The gather register is
// stored and loaded in halves at most (see GatherRegister): instructions on 512 bits would slow down the work on single
// elements around them.
template <class O, int Bits, class Which>
inline void gather(const void* base, const void* offsets, Which which, word* out) {
  constexpr int count = O::count / 4;
  constexpr auto numbers = std::make_index_sequence<count>();
  const __m128i q0 = fetch<O, Bits, 0>(base, offsets, which, numbers);
  const __m128i q1 = fetch<O, Bits, count>(base, offsets, which, numbers);
  const __m128i q2 = fetch<O, Bits, 2 * count>(base, offsets, which, numbers);
  const __m128i q3 = fetch<O, Bits, 3 * count>(base, offsets, which, numbers);
#if defined __AVX2__
  auto* half = reinterpret_cast<__m256i*>(out);
  _mm256_storeu_si256(half, _mm256_set_m128i(q1, q0));
  _mm256_storeu_si256(half + 1, _mm256_set_m128i(q3, q2));
#else
  auto* quarter = reinterpret_cast<__m128i*>(out);
  _mm_storeu_si128(quarter, q0);
  _mm_storeu_si128(quarter + 1, q1);
  _mm_storeu_si128(quarter + 2, q2);
  _mm_storeu_si128(quarter + 3, q3);
#endif
}

// The gather register is loaded in the halves that it was stored in. Store forwarding, which hands what was just
// stored to a load, fails for a load that spans two stores.
class GatherRegister {
 public:
  explicit GatherRegister(const word* stored) {
#if defined __AVX512BW__
    const auto* half = reinterpret_cast<const __m256i*>(stored);
    const __m512i low = _mm512_castsi256_si512(_mm256_loadu_si256(half));
    // The form with a mask of all ones: with the other the compiler warns of its own header.
    _mm512_store_si512(units_, _mm512_maskz_inserti64x4(0xFF, low, _mm256_loadu_si256(half + 1), 1));
#else
    std::memcpy(units_, stored, sizeof units_);
#endif
  }
  Read<u16x32> units() const { return Read<u16x32>(units_); }

 private:
  alignas(64) word units_[16];
};

// --- Scatters ---------------------------------------------------------------------------------------

// The lanes of an operand in turn. They are loaded before anything is stored and then come from registers. Between the
// stores of elements loads would be slow: elements may lie anywhere, in the operand too, so a processor may let each
// load wait for the store before it.
template <class L>
class InTurn {
 public:
  explicit InTurn(const void* operand) : InTurn(operand, std::make_index_sequence<L::bits * L::count / 128>()) {}

  // For i = 0, 1 ...
  template <int i>
  typename L::container lane() {
    __m128i& block = block_[i * L::bits / 128];
    if constexpr (i * L::bits % 32 == 0) {
      word_ = static_cast<word>(_mm_cvtsi128_si32(block));
      block = _mm_srli_si128(block, 4);
    } else {
      word_ >>= L::bits;
    }
    return static_cast<typename L::container>(word_);
  }

 private:
  template <std::size_t... I>
  InTurn(const void* operand, std::index_sequence<I...>)
      : block_{_mm_loadu_si128(static_cast<const __m128i*>(operand) + I)...} {}

  __m128i block_[L::bits * L::count / 128];
  word word_ = 0;
};

template <class Element>
inline void store(in_memory<Element>& element, Element value) {
  if constexpr (sizeof(Element) == 1) asm volatile("" : : "q"((&element)[1]));  // the byte after it is read
  element = value;
}

// Stores each lane of the data, in ascending order.
template <class Element, class O, class D, class Which, std::size_t... I>
inline void scatter(void* base, const void* offsets, Which which, const void* data, std::index_sequence<I...>) {
  InTurn<O> to(offsets);
  InTurn<D> from(data);
  (store(element<Element>(base, which.at(to.template lane<I>(), I)), static_cast<Element>(from.template lane<I>())),
   ...);
}
template <class Element, class O, class D, class Which>
inline void scatter(void* base, const void* offsets, Which which, const void* data) {
  scatter<Element, O, D>(base, offsets, which, data, std::make_index_sequence<O::count>());
}

// Adds 1 to each element, in ascending order.
template <class O, std::size_t... I>
inline void increment(void* base, const void* offsets, std::index_sequence<I...>) {
  InTurn<O> to(offsets);
  (++element<typename O::container>(base, distance(to.template lane<I>())), ...);
}
template <class O>
inline void increment(void* base, const void* offsets) {
  increment<O>(base, offsets, std::make_index_sequence<O::count>());
}

}  // namespace

#endif
