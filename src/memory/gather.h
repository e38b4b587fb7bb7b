// Gather and scatter: elements at a base address plus a byte offset each, unsigned 32-bit, wrapping.
#ifndef KASTARRI_MEMORY_GATHER_H
#define KASTARRI_MEMORY_GATHER_H

#include <immintrin.h>

#include <cstring>
#include <utility>

#include "frame/lanes.h"
#include "frame/registers.h"

namespace {

template <class Unit>
inline in_memory<Unit>& element(const void* base, word offset) {
  return *reinterpret_cast<in_memory<Unit>*>(reinterpret_cast<std::uintptr_t>(base) + offset);
}

// --- Predicates -------------------------------------------------------------------------------------

// A vector in parts. Wider ones than these would slow down what goes element by element beside them.
constexpr int part_bytes = register_bytes < 32 ? register_bytes : 32;
constexpr int parts = 64 / part_bytes;
template <class Lane>
struct part_of {
  typedef Lane type __attribute__((vector_size(part_bytes)));
};
template <class O>
using Part = typename part_of<typename O::container>::type;
template <class O>
using PartLanes = std::make_index_sequence<O::count / parts>;

// All ones in the lanes of part number k that a predicate enables.
template <class O, std::size_t... I>
inline Part<O> enabled_lanes(word predicate, int k, std::index_sequence<I...>) {
  constexpr Part<O> bit = {(typename O::container{1} << I)...};
  const auto own_bits = static_cast<typename O::container>(predicate >> k * static_cast<int>(sizeof...(I)));
  return reinterpret_cast<Part<O>>(((Part<O>{} + own_bits) & bit) == bit);
}
template <class O>
inline Part<O> enabled_lanes(word predicate, int k) {
  return enabled_lanes<O>(predicate, k, PartLanes<O>());
}

// Lanes D in the width of offsets O, the disabled ones as the last that is enabled (there is one). So elements are
// taken without a look at the predicate: a disabled lane does what another does anyhow, and of a scatter that is
// what stays.
template <class O, class D = O>
class LastForDisabled {
 public:
  LastForDisabled(const void* operand, word predicate) {
    const Read<D> lane(operand);
    const Part<O> last = Part<O>{} + static_cast<typename O::container>(lane[31 - __builtin_clz(predicate)]);
    for (int k = 0; k < parts; ++k) {
      const Part<O> enabled = enabled_lanes<O>(predicate, k);
      part_[k] = (enabled & part_at(lane, k, PartLanes<O>())) | (~enabled & last);
    }
  }
  const void* image() const { return part_; }

 private:
  template <std::size_t... I>
  static Part<O> part_at(Read<D> lane, int k, std::index_sequence<I...>) {
    return Part<O>{lane[k * static_cast<int>(sizeof...(I)) + static_cast<int>(I)]...};
  }

  Part<O> part_[parts];
};

// --- Gathers ----------------------------------------------------------------------------------------

// The offset of element i. Of 16 bits every other two are loaded together: processors have as much to do with
// loads here as with taking words apart.
template <class O>
inline word offset(const void* offsets, int i) {
  if (O::bits == 32 || i % 4 > 1) return Read<O>(offsets)[i];
  const word own_and_next = Read<u32x16>(offsets)[i / 2];
  return i % 2 == 0 ? own_and_next & 0xFFFF : own_and_next >> 16;
}

// A block of elements from number First on, the low Bits of each; offset(i) is that of element i.
template <int Bits, int First, class Offset, std::size_t... I>
inline __m128i fetch(const void* base, Offset offset, std::index_sequence<I...>) {
  if constexpr (Bits == 32) {
    const __m128i units[] = {_mm_cvtsi32_si128(element<std::int32_t>(base, offset(First + I)))...};
    return _mm_unpacklo_epi64(_mm_unpacklo_epi32(units[0], units[1]), _mm_unpacklo_epi32(units[2], units[3]));
  } else {
    __m128i units = _mm_setzero_si128();
    ((units = _mm_insert_epi16(units, element<std::int16_t>(base, offset(First + I)), I)), ...);
    asm("" : "+x"(units));  // of an 8-bit element the byte after it is read, used or not
    if constexpr (Bits == 8) units = _mm_and_si128(units, _mm_set1_epi16(0xFF));
    return units;
  }
}
template <class O, int Bits, int Block, class Offset>
inline __m128i fetch(const void* base, Offset offset) {
  constexpr int count = O::count / 4;
  return fetch<Bits, Block * count>(base, offset, std::make_index_sequence<count>());
}

// Gathers 32 elements of 16 or 8 bits or 16 of 32 bits into units of the offsets' width. The gather register is
// stored and loaded in parts (see GatherRegister).
template <class O, int Bits, class Offset, class Rule>
inline void gather_parts(const void* base, Offset offset, word* out, Rule rule) {
  const __m128i block[] = {fetch<O, Bits, 0>(base, offset), fetch<O, Bits, 1>(base, offset),
                           fetch<O, Bits, 2>(base, offset), fetch<O, Bits, 3>(base, offset)};
  for (int k = 0; k < parts; ++k) {
#if defined __AVX2__
    const auto part = reinterpret_cast<Part<O>>(_mm256_set_m128i(block[2 * k + 1], block[2 * k]));
#else
    const auto part = reinterpret_cast<Part<O>>(block[k]);
#endif
    const Part<O> stored = rule(part, k);
    std::memcpy(out + k * part_bytes / 4, &stored, part_bytes);
  }
}
template <class O, int Bits>
inline void gather(const void* base, const void* offsets, word* out) {
  gather_parts<O, Bits>(
      base, [=](int i) { return offset<O>(offsets, i); }, out, [](Part<O> part, int) { return part; });
}

// Under a predicate: disabled elements are not read, and their units are 0. In their stead the last enabled one is
// read, so that nothing branches on the predicate.
template <class O, int Bits>
inline void gather(const void* base, const void* offsets, word* out, word predicate) {
  if (predicate == 0) {
    std::memset(out, 0, 64);
    return;
  }
  const word last = Read<O>(offsets)[31 - __builtin_clz(predicate)];
  const auto chosen = [=](int i) {
    word own = Read<O>(offsets)[i];
    asm("" : "+r"(own));  // there in any case, so that compilers choose rather than branch
    return (predicate >> i & 1) != 0 ? own : last;
  };
  gather_parts<O, Bits>(base, chosen, out, [=](Part<O> part, int k) { return part & enabled_lanes<O>(predicate, k); });
}

// The gather register as it is read: in the parts that it was stored in, so that stores forward to loads.
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

// The lanes of an operand in turn, from registers: what is stored between two of them may lie anywhere, in the
// operand too, and a processor that takes a load to depend on such stores does one element after the other.
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
template <class Element, class O, class D, std::size_t... I>
inline void scatter(void* base, const void* offsets, const void* data, std::index_sequence<I...>) {
  InTurn<O> to(offsets);
  InTurn<D> from(data);
  (store(element<Element>(base, to.template lane<I>()), static_cast<Element>(from.template lane<I>())), ...);
}
template <class Element, class O, class D>
inline void scatter(void* base, const void* offsets, const void* data) {
  scatter<Element, O, D>(base, offsets, data, std::make_index_sequence<O::count>());
}
template <class Element, class O, class D>
inline void scatter(void* base, const void* offsets, const void* data, word predicate) {
  if (predicate == 0) return;
  const LastForDisabled<O> to(offsets, predicate);
  const LastForDisabled<O, D> from(data, predicate);
  scatter<Element, O, O>(base, to.image(), from.image());
}

// Adds 1 to each element, in ascending order.
template <class O, std::size_t... I>
inline void increment(void* base, const void* offsets, std::index_sequence<I...>) {
  InTurn<O> to(offsets);
  (++element<typename O::container>(base, to.template lane<I>()), ...);
}
template <class O>
inline void increment(void* base, const void* offsets) {
  increment<O>(base, offsets, std::make_index_sequence<O::count>());
}

}  // namespace

#endif
