// Accumulators written register by register: four registers of wide lanes come from one of narrow lanes.
#ifndef KASTARRI_MULTIPLY_WIDE_SUMS_H
#define KASTARRI_MULTIPLY_WIDE_SUMS_H

#include <utility>

#include "frame/registers.h"
#include "multiply/products.h"
#include "multiply/register_products.h"

namespace {

// Half Half of every block of low, and that of high, as pairs: low0 high0 low1 high1.
template <int Half>
inline LongWords pairs_of_words(Words low, Integers high) {
  return in_bits<LongWords>(interleaved<Half, word>(low, in_bits<Words>(high)));
}

// Some sums come 2^Scale times as large, for that is how they are made soonest: an 8-bit lane in the upper byte of 16
// bits is 2^8 times itself, and so are its products. This brings a sum down and extends it to a lane of R. A 24-bit sum
// at scale 8 lies at the top of its word already, and one shift does both.
template <class R, int Scale>
inline Words in_lane(Words sum) {
  constexpr int above = 32 - R::bits;
  if constexpr (above == 0 || above == Scale)
    return in_bits<Words>(in_bits<Integers>(sum) >> Scale);
  else
    return extended_from_24(sum);
}
template <class R, int>
inline LongWords in_lane(LongWords sum) {
  if constexpr (R::bits == 64) return sum;
  return extended_from_48(sum);
}

// Registers first .. first + 3 of the result from sum(quarter), quarter = 0 .. 3.
template <class R, class Kind, int Scale, class Sum, std::size_t... Quarter>
inline void put_quarters(const Sum& sum, int first, const void* acc, void* r, std::index_sequence<Quarter...>) {
  const auto put = [&](int k, auto v) {
    using V = decltype(v);
    if constexpr (!std::is_same_v<Kind, Fresh>)
      v = Kind::with(in_bits<V>(load_register<std::uint8_t>(acc, k)) << Scale, v);
    store_register(r, k, in_lane<R, Scale>(v));
  };
  (put(first + static_cast<int>(Quarter), sum(std::integral_constant<int, Quarter>())), ...);
}
template <class R, class Kind, int Scale, class Sum>
inline void put_sums(const Sum& sum, int first, const void* acc, void* r) {
  put_quarters<R, Kind, Scale>(sum, first, acc, r, std::make_index_sequence<4>());
}

}  // namespace

#endif
