// Packs: wide lanes back to narrow ones, the only place where products are rounded and saturated.
#include "frame/layouts.h"

#include "frame/arithmetic.h"

namespace {

// Rounds half up (ties toward plus infinity) while shifting right by count, then saturates. The sum
// of a 48-bit lane and the rounding constant fits 64 bits with room to spare.
constexpr auto PACKVR = [](word count) {
  const word s = count > 32 ? 32 : count;
  const std::int64_t round = s == 0 ? 0 : std::int64_t{1} << (s - 1);
  return [=](std::int64_t lane) { return saturate<std::int16_t>((lane + round) >> s); };
};

// A product of two Q15 numbers as Q15, rounded half up: bits 16 .. 31 of twice the low word plus a half.
constexpr auto PACKQ = [](std::int64_t lane) { return (2 * static_cast<word>(lane) + 0x8000) >> 16; };

}  // namespace

#include "frame/stamp.h"

#include "multiply/pack.def"

#include "frame/stamp_end.h"
