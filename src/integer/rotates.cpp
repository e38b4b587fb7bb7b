// Rotations and normalisation counts.
#include "integer/kernels.h"
#include "integer/packed.h"
#include "frame/scale.h"

namespace {

// Right by s is left by w - s: the product's low half, and in its high half what leaves the lane.
constexpr auto ROTR = [](auto x, auto count) {
  using U = decltype(x);
  const Scaled<U> product(x, static_cast<U>(0u - count));
  return product.low | product.high;
};

template <int w, class Unit>
struct ROTRI {
  explicit constexpr ROTRI(word given) : right(given % w), left((0 - given) % w) {}
  constexpr Unit operator()(Unit lanes) const { return static_cast<Unit>(right(lanes) | left(lanes)); }
  ShiftRight<w, Unit> right;
  ShiftLeft<w, Unit> left;
};

// Zero bits above the highest 1, which is looked for in the upper half of what is left each time.
template <class U, int Half = width<U> / 2>
constexpr U leading_zeros(U x) {
  const bool empty = x >> (width<U> - Half) == 0;
  const U zeros = empty ? Half : 0;
  if constexpr (Half == 1) {
    return static_cast<U>(zeros + (x == 0 ? 1 : 0));
  } else {
    const U rest = empty ? static_cast<U>(x << Half) : x;
    return static_cast<U>(zeros + leading_zeros<U, Half / 2>(rest));
  }
}

constexpr auto NSAU = [](auto x) { return leading_zeros(x); };
// The zero bits above the highest bit that differs from the sign, less the sign itself.
constexpr auto NSA = [](auto x) {
  return leading_zeros(unsigned_bits(static_cast<decltype(x)>(x ^ sign_fill(x)))) - 1;
};

}  // namespace

#include "integer/stamp.h"

#include "integer/rotates.def"

#include "frame/stamp_end.h"
