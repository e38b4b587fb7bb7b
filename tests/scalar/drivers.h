// Rows of the scalar core, one by one: operands and results as exact numbers, the crossed corners of all operands.
//
// A test source has a model a row, by the symbol's name, in namespace model, and includes the table between rows.h and
// rows_end.h.
#ifndef KASTARRI_TESTS_SCALAR_DRIVERS_H
#define KASTARRI_TESTS_SCALAR_DRIVERS_H

#include <algorithm>
#include <tuple>

#include "kastarri/scalar.h"
#include "scalar/shapes.h"
#include "support/drivers.h"

namespace testing_support {

constexpr Int TWO32 = Int{1} << 32;

template <class T>
using bare = std::remove_cv_t<std::remove_reference_t<T>>;

// The operands of scalar rows as numbers, and back.
template <class T>
Int number(const T& v) {
  if constexpr (std::is_integral_v<T>) {
    return Int{v};
  } else {
    return Int{v._[0]};
  }
}
template <class T>
T operand(Int v) {
  if constexpr (std::is_integral_v<T>) {
    return static_cast<T>(v);
  } else {
    T boolean;
    boolean._[0] = static_cast<unsigned char>(v);
    return boolean;
  }
}

// Corners; of an int, which may be a count, also every count from -32 to 64.
template <class T>
const std::vector<Int>& values_of() {
  using unit = std::conditional_t<std::is_integral_v<T>, T, unsigned char>;
  static const std::vector<Int> values = [] {
    std::vector<Int> all = corners<Layout<unit, 8 * sizeof(unit), 1>>();
    for (Int count = -32; std::is_same_v<T, int> && count <= 64; ++count)
      if (std::find(all.begin(), all.end(), count) == all.end()) all.push_back(count);
    return all;
  }();
  return values;
}

// Calls check(a, ...) for all values of the parameters A; further ones before them are given.
template <class... A, class Check, class... Given>
void for_values(const Check& check, Given... given) {
  constexpr std::size_t left = sizeof...(A) - sizeof...(Given);
  if constexpr (left == 0) {
    check(given...);
  } else {
    using Next = std::tuple_element_t<sizeof...(Given), std::tuple<A...>>;
    for (Int value : values_of<Next>()) {
      for_values<A...>(check, given..., value);
      if (left > 1 && testing::Test::HasFatalFailure()) return;
    }
  }
}

template <class... Values>
std::string list(Values... values) {
  std::string text;
  ((text += (text.empty() ? "(" : ", ") + std::to_string(values)), ...);
  return text + ")";
}

}  // namespace testing_support

#endif
