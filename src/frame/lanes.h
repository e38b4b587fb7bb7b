// Lane access and the lane loop: an operation is a rule on lanes, applied to every lane here.
#ifndef KASTARRI_FRAME_LANES_H
#define KASTARRI_FRAME_LANES_H

#include <cstring>

#include "frame/layouts.h"
#include "frame/predicate.h"

// A result may share memory with an operand: r = r + b. Lane i of the result depends on lane i of such an operand and
// on none of its others, so the compiler may compute lanes in any order and many at a time. This tells it so.
#ifdef __clang__
#define KASTARRI_LANES_INDEPENDENT _Pragma("clang loop vectorize(assume_safety)")
#else
#define KASTARRI_LANES_INDEPENDENT _Pragma("GCC ivdep")
#endif

namespace {

// The lanes of an operand. Bits of a container that are not the lane's own are never seen.
template <class L>
class Read {
 public:
  explicit Read(const void* register_image)
      : lanes_(static_cast<const in_memory<typename L::container>*>(register_image)) {}

  auto operator[](int i) const { return canonical<L>(typename L::container{lanes_[i]}); }

 private:
  const in_memory<typename L::container>* lanes_;
};

// The same of an operand that what is stored meanwhile may lie in part of, as memory may of a register: all lanes are
// loaded before.
template <class L>
class ReadWhole {
 public:
  explicit ReadWhole(const void* image) { std::memcpy(image_, image, sizeof image_); }

  auto operator[](int i) const { return Read<L>(image_)[i]; }

 private:
  alignas(64) unsigned char image_[L::count * sizeof(typename L::container)];
};

// One value that stands for a lane of every index: an immediate, a replicated element.
template <class T>
class Same {
 public:
  explicit Same(T value) : value_(value) {}
  T operator[](int) const { return value_; }

 private:
  T value_;
};

// The lanes of a result, always stored in canonical form.
template <class L>
class Write {
 public:
  explicit Write(void* register_image) : lanes_(static_cast<in_memory<typename L::container>*>(register_image)) {}

  template <class V>
  void put(int i, V value) const {
    lanes_[i] = canonical<L>(value);
  }

  const Write& writer() const { return *this; }

  void* image() const { return lanes_; }

 private:
  in_memory<typename L::container>* lanes_;
};

// The result of a predicated operation. A lane whose predicate bit is 0 keeps its value; in the
// clearing form, which loads use, it becomes 0.
template <class L, bool Clear>
class Predicated {
  // Bits come to lanes of a whole register quickest, even where the result has half of one.
  static constexpr int bits = 8 * sizeof(typename L::container);
  static constexpr int mask_bits = bits * L::count == 256 ? 2 * bits : bits;

 public:
  template <class PredicateUnit>
  Predicated(void* register_image, const PredicateUnit* predicate)
      : lanes_(static_cast<in_memory<typename L::container>*>(register_image)) {
    enabled_.expand(predicate);
  }

  // What a loop over lanes writes with. Beside the mask, an array, compilers would take the pointer for something that
  // a store of lanes may change.
  struct Writer {
    using C = typename L::container;
    in_memory<C>* lanes;
    const mask_lane<mask_bits>* enabled;

    template <class V>
    void put(int i, V value) const {
      const C given = canonical<L>(value), mask = static_cast<C>(enabled[i]);
      if constexpr (Clear) {
        lanes[i] = static_cast<C>(given & mask);
      } else if constexpr (L::count == 1) {
        if (mask) lanes[i] = given;
      } else {
        const C kept = lanes[i];
        lanes[i] = static_cast<C>(kept ^ ((kept ^ given) & mask));
      }
    }
  };

  Writer writer() const { return {lanes_, enabled_.lane}; }

  template <class V>
  void put(int i, V value) const {
    writer().put(i, value);
  }

 private:
  in_memory<typename L::container>* lanes_;
  LaneMask<mask_bits, L::count> enabled_;
};

// What an entry hands to a semantic function as its output: plain units, or units under a predicate.
template <class Unit, class PredicateUnit, bool Clear>
struct UnitsUnder {
  Unit* units;
  const PredicateUnit* predicate;
};

template <class Unit, class PredicateUnit>
inline UnitsUnder<Unit, PredicateUnit, false> where(Unit* units, const PredicateUnit* predicate) {
  return {units, predicate};
}

template <class Unit, class PredicateUnit>
inline UnitsUnder<Unit, PredicateUnit, true> clear(Unit* units, const PredicateUnit* predicate) {
  return {units, predicate};
}

template <class L, class Unit>
inline Write<L> result(Unit* units) {
  return Write<L>(units);
}

template <class L, class Unit, class PredicateUnit, bool Clear>
inline Predicated<L, Clear> result(UnitsUnder<Unit, PredicateUnit, Clear> out) {
  return Predicated<L, Clear>(out.units, out.predicate);
}

// The rule of what goes over as it is: extended by the layout it is read from, cut to the one it is written to.
constexpr auto SAME = [](auto lane) { return lane; };

// result lane i = rule(operand lanes i ...), for i = 0 .. Count - 1.
template <int Count, class Out, class Rule, class... Operands>
inline void lanes(const Out& out, Rule rule, const Operands&... operands) {
  const auto writer = out.writer();
  KASTARRI_LANES_INDEPENDENT
  for (int i = 0; i < Count; ++i) writer.put(i, rule(operands[i]...));
}

// Bit i of the result = rule(operand lanes i ...): comparisons. The lanes are LaneBits wide.
template <int LaneBits, int Count, class PredicateUnit, class Rule, class... Operands>
inline void lane_bits(PredicateUnit* out, Rule rule, const Operands&... operands) {
  LaneMask<LaneBits, Count> holds;
  KASTARRI_LANES_INDEPENDENT
  for (int i = 0; i < Count; ++i) {
    using M = typename LaneMask<LaneBits, Count>::lane_type;
    holds.lane[i] = rule(operands[i]...) ? static_cast<M>(-1) : M{0};
  }
  holds.collect(out);
}

}  // namespace

#endif
