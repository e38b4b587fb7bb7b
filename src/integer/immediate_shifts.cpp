// Shifts by one immediate count for all lanes.
#include "frame/arithmetic.h"

#include "integer/kernels.h"
#include "integer/packed.h"

namespace {

template <int w, class Unit>
struct SLLI : ShiftLeft<w, Unit> {
  explicit constexpr SLLI(word given) : ShiftLeft<w, Unit>(given % w) {}
};

template <int w, class Unit>
struct SRLI : ShiftRight<w, Unit> {
  explicit constexpr SRLI(word given) : ShiftRight<w, Unit>(given % w) {}
};

// The logical shift, and for negative lanes ones from the sign bit down to where it was shifted to: of 8 bits by 3, the
// sign 1000'0000 is shifted to 0001'0000, and 1000'0000 | (1000'0000 - 0001'0000) fills 1111'0000.
template <int w, class Unit>
struct SRAI {
  explicit constexpr SRAI(word given) : shift(given % w) {}
  constexpr Unit operator()(Unit lanes) const {
    const Unit sign = lanes & in_every_lane<w>(static_cast<Unit>(std::uint64_t{1} << (w - 1)));
    return static_cast<Unit>(shift(lanes) | sign | static_cast<Unit>(sign - (sign >> shift.count)));
  }
  ShiftRight<w, Unit> shift;
};

// A lane that the shift would take out of range becomes the end of the range: of 8 bits by 2, `high` is 127 >> 2 = 31,
// and lanes from -32 to 31 are in range. The shift is a product with 2^2, for not every target shifts 16-bit lanes by a
// count known at run time.
template <class T>
struct SLSI {
  explicit constexpr SLSI(word given)
      : power(word{1} << given % (8 * sizeof(T))), high(static_cast<T>(max >> given % (8 * sizeof(T)))) {}
  constexpr T operator()(T x) const {
    const T shifted = static_cast<T>(unsigned_bits(x) * power);
    return x > high ? max : x < static_cast<T>(~high) ? static_cast<T>(~max) : shifted;
  }
  static constexpr T max = std::numeric_limits<T>::max();
  word power;
  T high;
};

}  // namespace

#include "integer/stamp.h"

#include "integer/immediate_shifts.def"

#include "frame/stamp_end.h"
