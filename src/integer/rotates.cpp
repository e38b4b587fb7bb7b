// Rotations and normalisation counts.
#include "integer/kernels.h"
#include "integer/packed.h"
#include "frame/scale.h"

namespace {

// Right by s is left by w - s, which is -s mod w: x * 2^(w - s) has x << (w - s) in its low half and what that shifts
// out of the lane, x >> s, in its high half.
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

// Zero bits above the highest 1, by halving: if the upper half is 0, its width is counted and the lower half is looked
// into, else the upper one. Of 16 bits the halves are 8, 4, 2 and 1 wide.
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
