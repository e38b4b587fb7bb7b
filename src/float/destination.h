// Where results of floats go: to all lanes, or to those that a predicate enables.
#ifndef KASTARRI_FLOAT_DESTINATION_H
#define KASTARRI_FLOAT_DESTINATION_H

#include "frame/lanes.h"
#include "frame/registers.h"

namespace {

template <class L>
using lane_of = typename L::container;

// Registers that hold a vector of layout L.
template <class L>
constexpr int registers_of = L::count* L::bits / (8 * register_bytes);

// By registers.
template <class L, class Out>
class Destination {
 public:
  static constexpr bool is_predicated = false;
  explicit Destination(Out units) : units_(units) {}

  Vector<lane_of<L>> enabled(Vector<lane_of<L>> lanes, int) const { return lanes; }
  void store(int k, Vector<lane_of<L>> result) const { store_register(units_, k, result); }

 private:
  Out units_;
};
template <class L, class Unit, class PredicateUnit>
class Destination<L, UnitsUnder<Unit, PredicateUnit, false>> {
 public:
  static constexpr bool is_predicated = true;
  explicit Destination(UnitsUnder<Unit, PredicateUnit, false> out) : units_(out.units) { mask_.expand(out.predicate); }

  Vector<lane_of<L>> enabled(Vector<lane_of<L>> lanes, int k) const {
    return lanes & load_register<lane_of<L>>(mask_.lane, k);
  }
  void store(int k, Vector<lane_of<L>> result) const {
    const auto old = load_register<lane_of<L>>(units_, k);
    store_register(units_, k, old ^ enabled(old ^ result, k));
  }

 private:
  Unit* units_;
  LaneMask<L::bits, L::count> mask_;
};

// One lane: whether it is enabled, and where it is.
template <class Unit>
inline bool is_enabled(const Unit*) {
  return true;
}
template <class Unit>
inline Unit* units_of(Unit* out) {
  return out;
}
template <class Unit, class PredicateUnit>
inline bool is_enabled(UnitsUnder<Unit, PredicateUnit, false> out) {
  return (out.predicate[0] & 1) != 0;
}
template <class Unit, class PredicateUnit>
inline Unit* units_of(UnitsUnder<Unit, PredicateUnit, false> out) {
  return out.units;
}

}  // namespace

#endif
