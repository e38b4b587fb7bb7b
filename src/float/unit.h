// The unit that whole vectors are computed on: AVX-512's, or else the host's as its control word has it.
#ifndef KASTARRI_FLOAT_UNIT_H
#define KASTARRI_FLOAT_UNIT_H

#ifdef __AVX512F__
#include "float/avx512.h"
#else
#include "float/host.h"
#endif

namespace {

#ifdef __AVX512F__
constexpr bool rounds_by_instruction = true;

template <class R, class... Ls, class Mode, class Rule, class... Units>
inline HostResult on_unit(const Mode& mode, typename R::container* results, Rule rule, const Units*... operands) {
  constexpr bool rounds_to_integers =
      std::is_invocable_v<Rule, Mode, decltype(load_sixteen<Ls, to_nearest>(nullptr, 0))...>;
  return with_subnormals([&] {
    if constexpr (R::bits == 16 && !rounds_to_integers)
      return halves_by_instruction<R, Ls...>(mode, results, rule, operands...);
    else
      return by_instruction<R, Ls...>(mode, results, rule, operands...);
  });
}
template <class R, class From, class Units>
inline HostResult truncated_on_unit(typename R::container* results, word scale, const Units* operand) {
  return with_subnormals([&] { return truncated_by_instruction<R, From>(results, scale, operand); });
}
#else
constexpr bool rounds_by_instruction = false;

template <class R, class... Ls, class Mode, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult on_unit(const Mode& mode, typename R::container* results, Rule rule,
                                                 const Units*... operands) {
  return on_host<R, Ls...>(mode, results, rule, operands...);
}
template <class R, class From, class Units>
inline HostResult truncated_on_unit(typename R::container* results, word scale, const Units* operand) {
  return truncated_on_host<R, From>(results, scale, operand);
}
#endif

}  // namespace

#endif
