// Wide lanes shifted right and clamped in registers, as words on their way to narrow lanes.
// Of a 48-bit lane that is packed to 16 bits, 32 bits are enough: for a count up to 16 the low ones, above 16 those
// without the low 16 bits, of which no shift leaves a trace. A lane that does not fit the low 32 bits saturates by any
// count up to 16.
#ifndef KASTARRI_MULTIPLY_SHIFTED_H
#define KASTARRI_MULTIPLY_SHIFTED_H

#include "frame/layouts.h"
#include "frame/registers.h"
#include "multiply/saturated.h"

namespace {

using Int = Vector<std::int32_t>;
using Word = Vector<std::uint32_t>;
using Pairs = Vector<std::uint64_t>;

inline Int signed_words(Word v) { return reinterpret_cast<Int>(v); }
inline Word unsigned_words(Int v) { return reinterpret_cast<Word>(v); }
inline Int either(Int where, Int there, Int elsewhere) { return (there & where) | (elsewhere & ~where); }

// 24-bit lanes have room for a half besides.
template <class Rounding>
inline Int shifted24(Word lanes, word count) {
  if constexpr (Rounding::added == 0) return shifted_right(signed_words(lanes << 8), count + 8);
  const Int half = Int{} + static_cast<std::int32_t>(word{1} << count >> 1);
  return shifted_right(signed_words(extended_from_24(lanes)) + half, count);
}

// The two words of which a 48-bit lane needs one: its low 32 bits, and those from bit 16 on.
struct Windows {
  Int low, high;

  Windows(Pairs a, Pairs b)
      : low(signed_words(every_other_word<0>(bits_of(a), bits_of(b)))),
        high(signed_words(every_other_word<0>(bits_of(a >> 16), bits_of(b >> 16)))) {}

  Int lane_fits_low() const {
    const auto one = reinterpret_cast<Vector<std::int16_t>>(Word{} + 1);
    return sums_of_products(reinterpret_cast<Vector<std::int16_t>>(high), one) == high;
  }
  Int low_clamped() const {
    return either(lane_fits_low(), low, (high >> 31) ^ std::numeric_limits<std::int32_t>::max());
  }
};

// 32 lanes of 48 bits packed to 16: rule(windows of half the lanes of a register, which half, which register).
template <class Rule>
[[gnu::always_inline]] inline void pack_windows(const word* acc, word* r, Rule rule) {
  for (int k = 0; k < 64 / register_bytes; ++k) {
    const auto words = [&](int first, auto half) {
      const Windows windows(load_register<std::uint64_t>(acc, first), load_register<std::uint64_t>(acc, first + 1));
      return reinterpret_cast<Register>(rule(windows, half, k));
    };
    const Register low = words(4 * k, std::integral_constant<int, 0>());
    const Register high = words(4 * k + 2, std::integral_constant<int, 1>());
    store_register(r, k, in_order<word>(bits_of(pack_words(low, high))));
  }
}

// Rounded half up: twice as much, and a half of that added.
template <class Rounding>
inline Int rounded_shifted(Int v, word count) {
  if constexpr (Rounding::added == 0) return shifted_right(v, count);
  const Int twice = shifted_right(v, count - 1);
  return twice - (twice >> 1);
}

template <class Rounding>
inline void pack48(const word* acc, word count, word* r) {
  if (count > 16)
    pack_windows(acc, r, [=](Windows w, auto, int) { return rounded_shifted<Rounding>(w.high, count - 16); });
  else if (count > 0)
    pack_windows(acc, r, [=](Windows w, auto, int) { return rounded_shifted<Rounding>(w.low_clamped(), count); });
  else
    pack_windows(acc, r, [=](Windows w, auto, int) { return w.low_clamped(); });
}

// By counts of the lanes' own. A lane that saturates by any count up to 16 does so unshifted from bit 16 on.
template <class Rounding>
inline Int shifted_by_own(Windows w, Int count, Int count_above_16) {
  const Int low_serves = w.lane_fits_low() & (count_above_16 == 0);
  const Int window = either(low_serves, w.low, w.high), by = (count & low_serves) | count_above_16;
  if constexpr (Rounding::added == 0) return window >> by;
  return (window >> by) + signed_words((unsigned_words(window) << 1) >> unsigned_words(by) & 1);
}

// A count above 32 stands for 32.
inline Vector<std::uint16_t> clamped_counts(Vector<std::uint16_t> n) {
  const auto served = reinterpret_cast<Vector<std::uint16_t>>((n & 0xFFE0) == 0);
  return (n & served) | (32 & ~served);
}

template <class Rounding>
inline void pack48_by_counts(const word* acc, const word* counts, word* r) {
  pack_windows(acc, r, [=](Windows w, auto half, int k) {
    const auto n = clamped_counts(as<std::uint16_t>(dealt(load_register<std::uint8_t>(counts, k))));
    const auto above_16 = (n - 16) & reinterpret_cast<Vector<std::uint16_t>>(n > 16);
    constexpr int number = decltype(half)::value;
    const auto as_words = [](Vector<std::uint16_t> v) {
      return reinterpret_cast<Int>(interleaved<number, std::uint16_t>(bits_of(v), Vector<std::uint8_t>{}));
    };
    return shifted_by_own<Rounding>(w, as_words(n), as_words(above_16));
  });
}

}  // namespace

#endif
