// The bytes that an intrinsic touches, from the type of its function:
//
//   const T&  T&                      a register where the program has it
//   const M* base, int offset         an object M at base + offset bytes
//   const M** pointer  M** pointer    one at the pointer: it is read, or written
//   const E* base, const O& offsets   an element E for each lane of O
//   ..., const P& p                   of these the lanes whose predicate bit is 1
//
// Through a base is read what gives a result, and written else.
#ifndef KASTARRI_CHECK_ACCESSES_H
#define KASTARRI_CHECK_ACCESSES_H

#include <cstdint>
#include <string_view>
#include <tuple>
#include <type_traits>

#include "check/report.h"
#include "frame/entry.h"
#include "frame/lanes.h"

namespace check {

template <class T, class = void>
struct lanes_of {
  static constexpr int count = 1;
  static constexpr bool is_predicate = false;
};
template <class T>
struct lanes_of<T, std::enable_if_t<std::is_class_v<T>>> {
  static constexpr int count = layout_of<T>::count;
  static constexpr bool is_predicate = std::is_same_v<typename layout_of<T>::number, predicate_bit> && count > 1;
};

template <class T>
using plain = std::remove_cv_t<std::remove_reference_t<T>>;

// Which lanes are accessed.
struct EveryLane {
  bool operator()(int) const { return true; }
};
template <class P>
struct EnabledLanes {
  const P& predicate;
  int first;
  bool operator()(int i) const {
    const auto* const bytes = reinterpret_cast<const unsigned char*>(predicate._);
    return (bytes[(first + i) / 8] >> (first + i) % 8 & 1) != 0;
  }
};

inline const void* moved(const void* base, std::intptr_t step) {
  return reinterpret_cast<const void*>(reinterpret_cast<std::uintptr_t>(base) + static_cast<std::uintptr_t>(step));
}

template <class Row, class R, class... A>
struct Accesses {
  using Operands = std::tuple<A...>;
  template <std::size_t i>
  using Operand = std::tuple_element_t<i, Operands>;
  static constexpr std::size_t count = sizeof...(A);

  static void check(A&... operands) {
    (check_register<A>(operands), ...);
    if constexpr (memory() < count) check_memory(Operands(operands...));
  }

 private:
  // The pointer among the operands.
  static constexpr std::size_t memory() {
    std::size_t i = 0;
    (void)((!std::is_pointer_v<A> && ++i) && ...);
    return i;
  }

  template <class T>
  static void check_register(std::remove_reference_t<T>& operand) {
    if constexpr (std::is_reference_v<T>) {
      const void* at = &operand;
      // A word of coefficients is the one in whose bytes the reference points.
      if constexpr (std::is_same_v<plain<T>, qv_int32pr>) at = moved(at, -(reinterpret_cast<std::intptr_t>(at) & 3));
      touch(Row::name, at, sizeof operand, !std::is_const_v<std::remove_reference_t<T>>);
    }
  }

  static void check_memory(const Operands& operands) {
    using Pointer = Operand<memory()>;
    using To = std::remove_pointer_t<Pointer>;
    const auto pointer = std::get<memory()>(operands);
    if constexpr (std::is_pointer_v<To>) {
      using M = std::remove_pointer_t<To>;
      touch(Row::name, pointer, sizeof *pointer, true);
      check_object<std::remove_cv_t<M>>(*pointer, !std::is_const_v<M>, operands);
    } else {
      using Next = Operand<memory() + 1>;
      const auto& next = std::get<memory() + 1>(operands);
      if constexpr (std::is_same_v<Next, int>)
        check_object<std::remove_cv_t<To>>(moved(pointer, next), std::is_void_v<R>, operands);
      else
        check_elements<sizeof(To)>(pointer, next, operands);
    }
  }

  // What a predicate at the end enables.
  static auto which(const Operands& operands) {
    using Last = plain<Operand<count - 1>>;
    if constexpr (lanes_of<Last>::is_predicate)
      return EnabledLanes<Last>{std::get<count - 1>(operands), Row::first_lane};
    else
      return EveryLane();
  }

  template <class M>
  static void check_object(const void* at, bool writes, const Operands& operands) {
    const auto enabled = which(operands);
    if constexpr (!std::is_same_v<decltype(enabled), const EveryLane>) {
      constexpr int lanes = lanes_of<plain<Operand<count - 1>>>::count, bytes = sizeof(M) / lanes;
      static_assert(sizeof(M) % lanes == 0);
      bool any = false;
      for (int i = 0; i < lanes; ++i) {
        if (!enabled(i)) continue;
        any = true;
        touch(Row::name, moved(at, i * bytes), bytes, writes);
      }
      if (all_bytes() && (any || !writes)) touch(Row::name, at, sizeof(M), false);
    } else if constexpr (Row::converts && !std::is_class_v<M>) {
      // The address of a host's number is rounded down.
      touch(Row::name, moved(at, -static_cast<std::intptr_t>(reinterpret_cast<std::uintptr_t>(at) % sizeof(M))),
            sizeof(M), writes);
    } else if constexpr (Row::converts && lanes_of<R>::count == 1 && !std::is_void_v<R>) {
      touch(Row::name, at, sizeof(M) / lanes_of<M>::count, writes);  // lane 0
    } else {
      touch(Row::name, at, sizeof(M), writes);
    }
  }

  template <std::size_t bytes, class O>
  static void check_elements(const void* base, const O& offsets, const Operands& operands) {
    const auto enabled = which(operands);
    const Read<layout_of<O>> offset(offsets._);
    for (int i = 0; i < layout_of<O>::count; ++i) {
      if (!enabled(i)) continue;
      // Of 16 bits they have no sign, of 32 bits they have.
      const void* const at = moved(base, std::intptr_t{static_cast<std::int32_t>(offset[i])});
      touch(Row::name, at, bytes, std::is_void_v<R>);
      if (bytes == 1 && all_bytes()) touch(Row::name, at, 2, false);
    }
  }
};

}  // namespace check

#endif
