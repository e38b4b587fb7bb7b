/// The lanes of registers for tests and for the program around a kernel. Nothing here is an intrinsic: the core has
/// none of it, and a kernel that is to run there does without.
///
///     qv_vecNx16 v = kastarri::from_lanes<qv_vecNx16>({1, -2, 3});               // the other lanes are 0
///     v = kastarri::by_lane<qv_vecNx16>([](int i) { return 100 * i; });           // 0, 100, ... 3100
///     kastarri::set_lane(v, 7, -1);
///     const short seventh = kastarri::lane(v, 7);
///     for (const short x : kastarri::lanes(v)) sum += x;                          // std::array<std::int16_t, 32>
///     const bool same = kastarri::equal(v, w);
///     const auto halves = kastarri::parts<short>(coefficients);                   // of a qv_int32pr, the low one
///     first
///
/// Lane 0 comes first, as everywhere. A lane is the smallest type of C++ that holds it: 24 bits are an std::int32_t, 48
/// bits an std::int64_t, a bit of a predicate a bool, half and single floats a float. Lanes of 128 and 256 bits, which
/// are no numbers, are arrays of words.
///
/// In a program whose parts are compiled for different instruction sets these functions, like those of print.h, are for
/// parts that every processor runs: the linker takes one copy of each, from any part.
#ifndef KASTARRI_LANES_H
#define KASTARRI_LANES_H

#include "kastarri/library.h"

#include <array>
#include <cassert>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <initializer_list>
#include <iterator>
#include <type_traits>

#include "kastarri/layouts.h"
#include "kastarri/replicate.h"
#include "kastarri/types.h"

namespace kastarri {
namespace lanes_detail {

typedef unsigned long long Pattern;

// What the bits of a lane stand for: of() makes a value of them, pattern() makes them of a value.
template <char kind, int bits>
struct Number;

template <class Value, int bits>
struct Integer {
  typedef Value Lane;
  static Lane of(Pattern p) { return static_cast<Lane>(extended<bits, std::is_signed<Lane>::value>(p)); }
  static Pattern pattern(Lane value) { return static_cast<Pattern>(value); }
};
template <>
struct Number<'i', 8> : Integer<std::int8_t, 8> {};
template <>
struct Number<'i', 16> : Integer<std::int16_t, 16> {};
template <>
struct Number<'i', 24> : Integer<std::int32_t, 24> {};
template <>
struct Number<'i', 32> : Integer<std::int32_t, 32> {};
template <>
struct Number<'i', 48> : Integer<std::int64_t, 48> {};
template <>
struct Number<'i', 64> : Integer<std::int64_t, 64> {};
template <>
struct Number<'u', 8> : Integer<std::uint8_t, 8> {};
template <>
struct Number<'u', 16> : Integer<std::uint16_t, 16> {};
template <>
struct Number<'u', 32> : Integer<std::uint32_t, 32> {};
template <>
struct Number<'w', 32> : Integer<std::uint32_t, 32> {};

template <>
struct Number<'f', 32> {
  typedef float Lane;
  static float of(Pattern p) {
    const std::uint32_t bits = static_cast<std::uint32_t>(p);
    float value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
  }
  static Pattern pattern(float value) { return bits_of(value); }
};

// x / 2^count, rounded to the nearest, ties to even: what is added lacks 1 of a half unless the last bit that stays
// is 1.
inline Pattern shifted_to_even(Pattern x, int count) {
  return (x + (1ull << (count - 1)) - 1 + (x >> count & 1)) >> count;
}

// Halves, by way of singles. In integers, so that the host's rounding mode and flush-to-zero make no difference.
template <>
struct Number<'f', 16> {
  typedef float Lane;
  // The exponents of singles are 112 above those of halves.
  static constexpr Pattern REBIAS = 112ull << 23;

  static float of(Pattern p) {
    const Pattern sign = (p & 0x8000) << 16, rest = p & 0x7fff;
    const bool subnormal = rest < 0x0400, finite = rest < 0x7c00;
    const Pattern single = subnormal ? bits_of(static_cast<float>(rest) * 5.9604644775390625e-8f)  // 2^-24
                           : finite  ? (rest << 13) + REBIAS
                                     : rest << 13 | 0x7f800000;
    return Number<'f', 32>::of(sign | single);
  }
  static Pattern pattern(float value) {
    const Pattern single = bits_of(value), sign = single >> 16 & 0x8000, rest = single & 0x7fffffff;
    if (rest > 0x7f800000) return sign | 0x7e00 | (rest >> 13 & 0x3ff);        // a NaN, quiet
    if (rest >= 0x47800000) return sign | 0x7c00;                              // 65536 and above
    if (rest >= 0x38800000) return sign | shifted_to_even(rest - REBIAS, 13);  // 2^-14 and above
    // A subnormal half counts units of 2^-24, a single of exponent e has units of 2^(e - 150).
    const int lost = 126 - static_cast<int>(rest >> 23);
    return lost > 25 ? sign : sign | shifted_to_even((rest & 0x7fffff) | 0x800000, lost);
  }
};

// The bytes of a register, and where among them its lanes lie: evenly, each in the low bits of its share.
template <class R, char kind_, int bits_, int count_>
struct Bytes {
  static constexpr int bits = bits_, count = count_, share = static_cast<int>(sizeof(R)) / count;

  static unsigned char* at(R& r, int i) { return reinterpret_cast<unsigned char*>(&r) + i * share; }
  static const unsigned char* at(const R& r, int i) { return reinterpret_cast<const unsigned char*>(&r) + i * share; }
  static bool same(const R& a, const R& b, int i) { return std::memcmp(at(a, i), at(b, i), bits / 8) == 0; }
};

template <class R, char kind, int bits, int count>
struct Numbers : Bytes<R, kind, bits, count> {
  using Bytes<R, kind, bits, count>::at;
  typedef Number<kind, bits> Meaning;
  typedef typename Meaning::Lane Lane;

  static Pattern pattern(const R& r, int i) {
    Pattern p = 0;
    std::memcpy(&p, at(r, i), bits / 8);
    return p;
  }
  static void set_pattern(R& r, int i, Pattern p) {
    const Pattern whole = extended<bits, kind == 'i'>(p);
    std::memcpy(at(r, i), &whole, sizeof(R) / static_cast<std::size_t>(count));
  }
  static Lane get(const R& r, int i) { return Meaning::of(pattern(r, i)); }
  static void set(R& r, int i, Lane value) { set_pattern(r, i, Meaning::pattern(value)); }
};

template <class R, int bits, int count>
struct Wide : Bytes<R, 'w', bits, count> {
  using Bytes<R, 'w', bits, count>::at;
  typedef std::array<std::uint32_t, bits / 32> Lane;

  static Lane get(const R& r, int i) {
    Lane words;
    std::memcpy(words.data(), at(r, i), sizeof words);
    return words;
  }
  static void set(R& r, int i, const Lane& words) { std::memcpy(at(r, i), words.data(), sizeof words); }
};

template <class R, int count_>
struct Bits {
  static constexpr int bits = 1, count = count_;
  typedef bool Lane;

  static Pattern pattern(const R& r, int i) { return reinterpret_cast<const unsigned char*>(&r)[i / 8] >> i % 8 & 1; }
  static void set_pattern(R& r, int i, Pattern p) {
    unsigned char& byte = reinterpret_cast<unsigned char*>(&r)[i / 8];
    byte = static_cast<unsigned char>((byte & ~(1u << i % 8)) | (static_cast<unsigned>(p) & 1) << i % 8);
  }
  static bool get(const R& r, int i) { return pattern(r, i) != 0; }
  static void set(R& r, int i, bool value) { set_pattern(r, i, value); }
  static bool same(const R& a, const R& b, int i) { return pattern(a, i) == pattern(b, i); }
};

template <class R, char kind, int bits, int count>
struct LaidOut
    : std::conditional<
          kind == 'b', Bits<R, count>,
          typename std::conditional<(bits > 64), Wide<R, bits, count>, Numbers<R, kind, bits, count>>::type>::type {};

// How the lanes of R are read and written.
template <class R>
struct Lanes;
#define KASTARRI_LAID_OUT(T, KIND, BITS, COUNT) \
  template <>                                   \
  struct Lanes<T##_space::T##_> : LaidOut<T##_space::T##_, #KIND[0], BITS, COUNT> {};
KASTARRI_REGISTER_TYPES(KASTARRI_LAID_OUT)
#undef KASTARRI_LAID_OUT

template <class R>
int checked(int i) {
  assert(i >= 0 && i < Lanes<R>::count && "a register has no such lane");
  return i;
}

}  // namespace lanes_detail

/// What a lane of the register type R is to C++.
template <class R>
using Lane = typename lanes_detail::Lanes<R>::Lane;

/// How many lanes R has.
template <class R>
constexpr int lane_count() {
  return lanes_detail::Lanes<R>::count;
}

/// Lane i. (A float comes from a function: in a 32-bit program a signalling NaN is quiet then. lane_bits has its bits.)
template <class R>
Lane<R> lane(const R& r, int i) {
  return lanes_detail::Lanes<R>::get(r, lanes_detail::checked<R>(i));
}

/// Gives lane i a value. Of an integer that the lane cannot hold it takes the low bits; a number for a half is rounded
/// to the nearest, ties to even.
template <class R>
void set_lane(R& r, int i, Lane<R> value) {
  lanes_detail::Lanes<R>::set(r, lanes_detail::checked<R>(i), value);
}

/// The bits of lane i, as many as it has: 0xffffff for -1 in 24 bits, 0x3c00 for 1 in a half. For lanes of up to 64.
template <class R>
unsigned long long lane_bits(const R& r, int i) {
  return lanes_detail::Lanes<R>::pattern(r, lanes_detail::checked<R>(i));
}
template <class R>
void set_lane_bits(R& r, int i, unsigned long long bits) {
  lanes_detail::Lanes<R>::set_pattern(r, lanes_detail::checked<R>(i), bits);
}

/// All lanes, to go through, to compare or to print.
template <class R>
std::array<Lane<R>, static_cast<std::size_t>(lane_count<R>())> lanes(const R& r) {
  std::array<Lane<R>, static_cast<std::size_t>(lane_count<R>())> all;
  for (int i = 0; i < lane_count<R>(); ++i) all[static_cast<std::size_t>(i)] = lane(r, i);
  return all;
}

/// The register whose lanes are the values of an array or a container, and 0 behind them. The program ends where there
/// are more values than lanes.
template <class R, class Values>
R from_lanes(const Values& values) {
  R r;
  std::memset(static_cast<void*>(&r), 0, sizeof r);
  int i = 0;
  for (auto at = std::begin(values); at != std::end(values); ++at) {
    assert(i < lane_count<R>() && "a register has fewer lanes");
    if (i == lane_count<R>()) std::abort();
    set_lane(r, i++, static_cast<Lane<R>>(*at));
  }
  return r;
}
template <class R>
R from_lanes(std::initializer_list<Lane<R>> values) {
  return from_lanes<R, std::initializer_list<Lane<R>>>(values);
}

/// The register whose lane i is value_of(i).
template <class R, class Function>
R by_lane(Function value_of) {
  R r;
  std::memset(static_cast<void*>(&r), 0, sizeof r);
  for (int i = 0; i < lane_count<R>(); ++i) set_lane(r, i, static_cast<Lane<R>>(value_of(i)));
  return r;
}

/// Whether all lanes have the same bits: 0 is not -0, and a NaN is itself. What lies beside the lanes does not count.
template <class R>
bool equal(const R& a, const R& b) {
  for (int i = 0; i < lane_count<R>(); ++i) {
    if (!lanes_detail::Lanes<R>::same(a, b, i)) return false;
  }
  return true;
}

/// The bytes of a register as numbers of a type of the host, the low ones first: a word of coefficients as two halves
/// or four bytes, a vector as whatever lanes.
template <class Part, class R>
std::array<Part, sizeof(R) / sizeof(Part)> parts(const R& r) {
  static_assert(sizeof(R) % sizeof(Part) == 0, "parts fill the register evenly");
  std::array<Part, sizeof(R) / sizeof(Part)> all;
  std::memcpy(all.data(), &r, sizeof r);
  return all;
}

/// The register made of them: from_parts<qv_int32pr, short>({low, high}).
template <class R, class Part, std::size_t count>
R from_parts(const Part (&parts)[count]) {
  static_assert(sizeof parts == sizeof(R), "parts fill the register");
  R r;
  std::memcpy(static_cast<void*>(&r), parts, sizeof r);
  return r;
}

}  // namespace kastarri

#endif
