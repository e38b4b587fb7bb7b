// Packs: wide lanes back to narrow ones, the only place where products are rounded and saturated.
#include "frame/layouts.h"

#include "frame/arithmetic.h"

namespace {

// A 48-bit lane in 32 bits without changing what a shift by s and saturation to 16 bits make of it:
// up to 16, the lane clamped to 32 bits, for whatever lies beyond saturates anyway; above 16, the lane
// without its low 16 bits, of which no shift leaves a trace.
constexpr auto low_part = [](std::uint64_t lane) {
  const auto low = static_cast<std::int32_t>(lane);
  const auto high = static_cast<std::int16_t>(lane >> 32);
  const std::int32_t bound =
      high < 0 ? std::numeric_limits<std::int32_t>::min() : std::numeric_limits<std::int32_t>::max();
  return high == low >> 31 ? low : bound;
};
constexpr auto high_part = [](std::uint64_t lane) { return static_cast<std::int32_t>(lane >> 16); };

// x shifted right by s (0 to 16), rounded half up: the last bit shifted out is added.
struct Rounded {
  explicit Rounded(word s) : shift(s), last(s == 0 ? 0 : s - 1), mask(s == 0 ? 0 : 1) {}
  std::int32_t operator()(std::int32_t x) const {
    return shift_right(x, shift) + static_cast<std::int32_t>(unsigned_bits(x) >> last & mask);
  }
  word shift, last, mask;
};

// A product of two Q15 numbers as Q15, rounded half up: bits 16 .. 31 of twice the low word plus a half.
constexpr auto PACKQ = [](std::uint64_t lane) { return (2 * static_cast<word>(lane) + 0x8000) >> 16; };

}  // namespace

#include "frame/stamp.h"

// Shift by one count for all lanes, clamped to 32, round, saturate: result layout, rounding.
#define KERNEL_pack48(OP, R, ROUNDING)                                                                  \
  template <class Units, class Out>                                                                     \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* acc, word count, Out r) {                       \
    const word s = count > 32 ? 32 : count;                                                             \
    const ROUNDING shift(s > 16 ? s - 16 : s);                                                          \
    const Read<u64x32> lane(acc);                                                                       \
    const auto pack = [&](auto part) {                                                                  \
      lanes<R::count>(                                                                                  \
          result<R>(r), [=](std::uint64_t v) { return saturate<R::container>(shift(part(v))); }, lane); \
    };                                                                                                  \
    s > 16 ? pack(high_part) : pack(low_part);                                                          \
  }

#include "multiply/pack.def"

#include "frame/stamp_end.h"
