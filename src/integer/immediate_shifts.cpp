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

// The logical shift, and where the sign is 1 the bits from it down to its shifted self.
template <int w, class Unit>
struct SRAI {
  explicit constexpr SRAI(word given) : shift(given % w) {}
  constexpr Unit operator()(Unit lanes) const {
    const Unit sign = lanes & in_every_lane<w>(static_cast<Unit>(std::uint64_t{1} << (w - 1)));
    return static_cast<Unit>(shift(lanes) | sign | static_cast<Unit>(sign - (sign >> shift.count)));
  }
  ShiftRight<w, Unit> shift;
};

// A lane that the shift would take out of range becomes a bound. The shift is a product, which every
// target has for halves too.
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
