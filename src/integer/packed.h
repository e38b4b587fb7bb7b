// Shifts of all lanes by one count, on units that hold several lanes each.
#ifndef KASTARRI_INTEGER_PACKED_H
#define KASTARRI_INTEGER_PACKED_H

#include <cstdint>

namespace {

// The bits of one lane, in every lane of w bits of a unit.
template <int w, class Unit>
constexpr Unit in_every_lane(Unit lane) {
  constexpr std::uint64_t one_lane = (std::uint64_t{1} << w) - 1;
  constexpr Unit one_of_each = static_cast<Unit>(static_cast<Unit>(-1) / one_lane);
  return static_cast<Unit>(lane * one_of_each);
}

// The whole unit is shifted, and the bits that came from the neighbouring lane are masked off: bytes shifted left by 3
// in a word keep 0xF8F8F8F8. count < w.
template <int w, class Unit>
struct ShiftLeft {
  explicit constexpr ShiftLeft(std::uint32_t s)
      : count(s),
        kept(in_every_lane<w>(static_cast<Unit>(((std::uint64_t{1} << w) - 1) & ~((std::uint64_t{1} << s) - 1)))) {}
  constexpr Unit operator()(Unit lanes) const { return static_cast<Unit>(lanes << count & kept); }
  std::uint32_t count;
  Unit kept;
};
template <int w, class Unit>
struct ShiftRight {
  explicit constexpr ShiftRight(std::uint32_t s)
      : count(s), kept(in_every_lane<w>(static_cast<Unit>(((std::uint64_t{1} << w) - 1) >> s))) {}
  constexpr Unit operator()(Unit lanes) const { return static_cast<Unit>(lanes >> count & kept); }
  std::uint32_t count;
  Unit kept;
};

}  // namespace

#endif
