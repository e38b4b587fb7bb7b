// Conversion between two layouts: by the counts of lanes, then lane by lane.
#ifndef KASTARRI_FRAME_CONVERT_H
#define KASTARRI_FRAME_CONVERT_H

#include <type_traits>

#include "frame/arithmetic.h"
#include "frame/entry.h"
#include "frame/lanes.h"
#include "frame/registers.h"
#include "frame/spill.h"

namespace {

// A host scalar is a register of one lane.
template <class H, bool = std::is_integral_v<H>>
struct host_layout_of {
  using type = Layout<H, 8 * sizeof(H), 1>;
};
template <>
struct host_layout_of<bool> {
  using type = Layout<std::uint8_t, 1, 1>;
};
template <>
struct host_layout_of<float> {
  using type = f32x1;
};
template <class H>
using host_layout = typename host_layout_of<H>::type;

template <class L>
constexpr bool is_predicate = std::is_same_v<typename L::number, predicate_bit>;

// Every lane the same value. A lane of two words is written as words: a 64-bit scalar would reach the
// vector registers through memory, in halves, and wait there.
template <class L, class V>
inline void replicate(const Write<L>& to, V value) {
  if constexpr (std::is_integral_v<V> && sizeof(typename L::container) == 8) {
    const auto container = static_cast<std::uint64_t>(canonical<L>(value));
    const auto low = static_cast<word>(container), high = static_cast<word>(container >> 32);
    in_memory<word>* words = static_cast<in_memory<word>*>(to.image());
    KASTARRI_LANES_INDEPENDENT
    for (int i = 0; i < L::count; ++i) {
      words[2 * i] = low;
      words[2 * i + 1] = high;
    }
  } else {
    lanes<L::count>(to, SAME, Same(value));
  }
}

// Numbers of different kinds convert by value: float/conversions.cpp.
template <class From, class To, class FromUnit, class ToUnit>
void convert_numbers(const FromUnit* from, ToUnit* to);
template <class From, class To>
constexpr bool are_different_numbers =
    !std::is_same_v<typename From::number, typename To::number> && From::bits != 1 && To::bits != 1;

// Lanes extended to twice their bits. Where they make one register of 64 bytes it is stored at once: a loop over lanes
// would store two halves, and a load of the whole is not forwarded from those.
template <class From, class To, template <class> class Operand = Read>
inline void extend_lanes(const void* from, void* to) {
  using Narrow = typename From::container;
  using Wide = typename To::container;
  if constexpr (2 * sizeof(Narrow) == sizeof(Wide) && To::count * sizeof(Wide) == register_bytes &&
                register_bytes == 64 && From::bits == 8 * sizeof(Narrow)) {
    typedef Narrow NarrowLanes __attribute__((vector_size(register_bytes / 2)));
    NarrowLanes narrow;
    std::memcpy(&narrow, from, sizeof narrow);
    store_register(to, 0, __builtin_convertvector(narrow, Vector<Wide>));
  } else {
    lanes<To::count>(Write<To>(to), SAME, Operand<From>(from));
  }
}

template <class From, class To, template <class> class Operand, class Rule>
inline void convert_lanes(const Operand<From>& from, const Write<To>& to, Rule rule) {
  static_assert(std::is_same_v<typename From::number, typename To::number> || From::bits == 1 || To::bits == 1,
                "numbers of different kinds convert by value");
  if constexpr (From::count == To::count) {
    lanes<To::count>(to, rule, from);
  } else if constexpr (From::count == 1) {
    replicate(to, rule(from[0]));
  } else {
    static_assert(To::count == 1);
    to.put(0, rule(from[0]));
  }
}

// vbool1 into every bit of a predicate of many lanes.
template <class To, class FromUnit, class ToUnit>
inline void replicate_bit(const FromUnit* from, ToUnit* to) {
  constexpr int units = To::count / (8 * sizeof(ToUnit));
  for (int i = 0; i < units; ++i) to[i] = static_cast<ToUnit>(*from & 1 ? -1 : 0);
}

template <class From, class To, template <class> class Operand = Read, class FromUnit, class ToUnit>
inline void convert(const FromUnit* from, ToUnit* to) {
  if constexpr (std::is_same_v<To, packed1536>) {
    spill<From>(from, to);
  } else if constexpr (std::is_same_v<From, packed1536>) {
    unspill<To>(from, to);
  } else if constexpr (are_different_numbers<From, To>) {
    convert_numbers<From, To>(from, to);
  } else if constexpr (is_predicate<To> && To::count > 1) {
    replicate_bit<To>(from, to);
  } else if constexpr (From::count == To::count) {
    extend_lanes<From, To, Operand>(from, to);
  } else {
    convert_lanes(Read<From>(from), Write<To>(to), SAME);
  }
}

// Memory holds a register as the register's own array does, and a host scalar as one lane.
template <class M, bool = std::is_class_v<M>>
struct memory_layout_of {
  using type = layout_of<M>;
};
template <class M>
struct memory_layout_of<M, false> {
  using type = host_layout<M>;
};
template <class M>
using memory_layout = typename memory_layout_of<M>::type;

// The bits of an address below a host scalar's size are ignored; a register type lies anywhere.
template <class M>
inline const M* element_address(const M* address) {
  if constexpr (std::is_class_v<M>) return address;
  return reinterpret_cast<const M*>(reinterpret_cast<std::uintptr_t>(address) & ~(sizeof(M) - 1));
}

// To memory, which may lie in part of the register, narrower signed lanes saturate. The images of accumulators hold
// their low bits instead.
template <class From, class To, class FromUnit, class Memory>
inline void convert_to_memory(const FromUnit* from, Memory* to) {
  using T = typename To::container;
  constexpr bool image = From::count > 1 && From::count == To::count && (From::bits == 24 || From::bits == 48);
  if constexpr (To::bits < From::bits && std::is_signed_v<T> && !image) {
    convert_lanes(ReadWhole<From>(from), Write<To>(to), [](auto lane) { return saturate<T>(lane); });
  } else {
    convert<From, To, ReadWhole>(from, to);
  }
}

}  // namespace

#endif
