// How the lanes of a register lie in memory: the container of a lane, the bits of it that are the
// lane's own, and how many lanes there are.
#ifndef KASTARRI_FRAME_LAYOUTS_H
#define KASTARRI_FRAME_LAYOUTS_H

#include <cstdint>
#include <type_traits>

// Everything in the frame has internal linkage: its instances are compiled once a target, and an
// instance for a newer processor must never serve an older one.
namespace {

using word = std::uint32_t;

// What a lane's bits stand for. Only conversions ask.
struct integer;
struct half_float;
struct single_float;
struct predicate_bit;

template <class Container, int Bits, int Count, class Number = integer>
struct Layout {
  using container = Container;
  using number = Number;
  static constexpr int bits = Bits;
  static constexpr int count = Count;
};

// i = signed, u = unsigned; bits x lanes.
using i8x64 = Layout<std::int8_t, 8, 64>;
using u8x64 = Layout<std::uint8_t, 8, 64>;
using i16x32 = Layout<std::int16_t, 16, 32>;
using u16x32 = Layout<std::uint16_t, 16, 32>;
using i32x16 = Layout<std::int32_t, 32, 16>;
using u32x16 = Layout<std::uint32_t, 32, 16>;
using i64x8 = Layout<std::int64_t, 64, 8>;

// Half-width vectors: what memory holds for lanes that are twice as wide in a register.
using i8x32 = Layout<std::int8_t, 8, 32>;
using u8x32 = Layout<std::uint8_t, 8, 32>;
using i16x16 = Layout<std::int16_t, 16, 16>;
using u16x16 = Layout<std::uint16_t, 16, 16>;

// Wide accumulators: a 24-bit lane in a word, a 48-bit lane in a pair of words, sign-extended.
using i24x64 = Layout<std::int32_t, 24, 64>;
using i48x32 = Layout<std::int64_t, 48, 32>;
using i64x16 = Layout<std::int64_t, 64, 16>;
// The whole containers of an accumulator, for rules to which the bits above a lane make no difference.
using u32x64 = Layout<std::uint32_t, 32, 64>;
using u64x32 = Layout<std::uint64_t, 64, 32>;

// Predicates of 64 bits and 64-bit scalars as plain bits.
using u32x2 = Layout<std::uint32_t, 32, 2>;
using u64x1 = Layout<std::uint64_t, 64, 1>;

// The 16-bit and 32-bit images of the accumulators.
using i16x64 = Layout<std::int16_t, 16, 64>;
using u16x64 = Layout<std::uint16_t, 16, 64>;
using i32x32 = Layout<std::int32_t, 32, 32>;
using u32x32 = Layout<std::uint32_t, 32, 32>;

using f16x32 = Layout<std::uint16_t, 16, 32, half_float>;
using f16x16 = Layout<std::uint16_t, 16, 16, half_float>;
using f32x16 = Layout<std::uint32_t, 32, 16, single_float>;

// Scalars of the vector unit, one lane each.
using i8x1 = Layout<std::int8_t, 8, 1>;
using u8x1 = Layout<std::uint8_t, 8, 1>;
using i16x1 = Layout<std::int16_t, 16, 1>;
using u16x1 = Layout<std::uint16_t, 16, 1>;
using i24x1 = Layout<std::int32_t, 24, 1>;
using i32x1 = Layout<std::int32_t, 32, 1>;
using u32x1 = Layout<std::uint32_t, 32, 1>;
using i48x1 = Layout<std::int64_t, 48, 1>;
using i64x1 = Layout<std::int64_t, 64, 1>;
using f16x1 = Layout<std::uint16_t, 16, 1, half_float>;
using f32x1 = Layout<std::uint32_t, 32, 1, single_float>;

// Booleans of the scalar core: the low bits of a byte.
using u1x1 = Layout<std::uint8_t, 1, 1>;
using u4x1 = Layout<std::uint8_t, 4, 1>;

// Predicates: a bit a lane, packed.
using b1x1 = Layout<std::uint8_t, 1, 1, predicate_bit>;
using b1x16 = Layout<std::uint16_t, 1, 16, predicate_bit>;
using b1x32 = Layout<std::uint32_t, 1, 32, predicate_bit>;
using b1x64 = Layout<std::uint32_t, 1, 64, predicate_bit>;

// Lanes wider than any host integer are only ever moved whole.
struct [[gnu::may_alias, gnu::packed]] bits128 {
  word part[4];
};
struct [[gnu::may_alias, gnu::packed]] bits256 {
  word part[8];
};
using w128x4 = Layout<bits128, 128, 4, bits128>;
using w128x1 = Layout<bits128, 128, 1, bits128>;
using w256x2 = Layout<bits256, 256, 2, bits256>;
using w256x1 = Layout<bits256, 256, 1, bits256>;

// Registers without lanes of their own.
using packed1536 = Layout<word, 32, 48, void>;
using bits512 = Layout<word, 32, 16, void>;

// A lane lies at any address and under any declared type.
template <class T>
struct lane_in_memory {
  typedef T type [[gnu::may_alias, gnu::aligned(1)]];
};
template <>
struct lane_in_memory<bits128> {
  using type = bits128;
};
template <>
struct lane_in_memory<bits256> {
  using type = bits256;
};
template <class T>
using in_memory = typename lane_in_memory<T>::type;

// The lane's own bits of v, extended to the container: the one form in which a lane is stored.
template <class L, class V>
inline typename L::container canonical(V v) {
  using C = typename L::container;
  if constexpr (!std::is_integral_v<V>) {
    return v;
  } else if constexpr (L::bits == 8 * sizeof(C)) {
    return static_cast<C>(v);
  } else {
    using U = std::make_unsigned_t<C>;
    constexpr U sign = U{1} << (L::bits - 1);
    constexpr U mask = static_cast<U>(2 * sign - 1);
    const U own = static_cast<U>(v) & mask;
    // (x ^ s) - s extends the sign without a shift that some targets lack for 64-bit lanes.
    if constexpr (std::is_signed_v<C>) return static_cast<C>((own ^ sign) - sign);
    return static_cast<C>(own);
  }
}

}  // namespace

#endif
