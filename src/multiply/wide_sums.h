// Accumulators written register by register: four registers of wide lanes come from one of narrow lanes.
#ifndef KASTARRI_MULTIPLY_WIDE_SUMS_H
#define KASTARRI_MULTIPLY_WIDE_SUMS_H

#include <utility>

#include "frame/registers.h"
#include "multiply/products.h"

namespace {

using Bytes = Vector<std::uint8_t>;

// The words of half Half of every block of low, and those of high, as pairs.
template <int Half>
inline Vector<std::uint64_t> pairs_of_words(Vector<word> low, Vector<std::int32_t> high) {
  return reinterpret_cast<Vector<std::uint64_t>>(interleaved<Half, word>(bits_of(low), bits_of(high)));
}

// A sum 2^Scale times as large in the canonical form of a lane of R.
template <class R, int Scale>
inline Vector<word> in_lane(Vector<word> sum) {
  constexpr int above = 32 - R::bits;
  if constexpr (above == 0 || above == Scale)
    return reinterpret_cast<Vector<word>>(reinterpret_cast<Vector<std::int32_t>>(sum) >> Scale);
  else
    return extended_from_24(sum);
}
template <class R, int>
inline Vector<std::uint64_t> in_lane(Vector<std::uint64_t> sum) {
  if constexpr (R::bits == 64) return sum;
  return extended_from_48(sum);
}

// What a sum is before it is cut to its lane: the sum alone, added to the accumulator's lane, subtracted from it.
template <int Scale, class V>
inline V scaled_lanes(const void* acc, int k) {
  return reinterpret_cast<V>(load_register<std::uint8_t>(acc, k)) << Scale;
}
struct Over {
  template <int, class V>
  static V with(V sum, const void*, int) {
    return sum;
  }
};
struct Onto {
  template <int Scale, class V>
  static V with(V sum, const void* acc, int k) {
    return scaled_lanes<Scale, V>(acc, k) + sum;
  }
};
struct From {
  template <int Scale, class V>
  static V with(V sum, const void* acc, int k) {
    return scaled_lanes<Scale, V>(acc, k) - sum;
  }
};

// Registers first .. first + 3 of the result from sum(quarter), quarter = 0 .. 3.
template <class R, class How, int Scale, class Sum, std::size_t... Quarter>
inline void put_quarters(const Sum& sum, int first, const void* acc, void* r, std::index_sequence<Quarter...>) {
  const auto put = [&](int k, auto v) {
    store_register(r, k, in_lane<R, Scale>(How::template with<Scale>(v, acc, k)));
  };
  (put(first + static_cast<int>(Quarter), sum(std::integral_constant<int, Quarter>())), ...);
}
template <class R, class How, int Scale, class Sum>
inline void put_sums(const Sum& sum, int first, const void* acc, void* r) {
  put_quarters<R, How, Scale>(sum, first, acc, r, std::make_index_sequence<4>());
}

}  // namespace

#endif
