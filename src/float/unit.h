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

template <class R, class... Ls, class Results, class Mode, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult on_unit(const Mode& mode, Results& results, Rule rule,
                                                 const Units*... operands) {
  return results.take([=](std::uint32_t enabled) __attribute__((always_inline)) {
    return by_rounding(
        mode, [=](auto rounding) __attribute__((always_inline)) {
          return by_instruction<R, decltype(rounding)::value, Ls...>(mode, enabled, rule, operands...);
        });
  });
}
template <class R, class From, class Results, class Units>
[[gnu::always_inline]] inline HostResult truncated_on_unit(Results& results, word scale, const Units* operand) {
  return results.take([=](std::uint32_t) { return truncated_by_instruction<R, From>(scale, operand); });
}
#else
constexpr bool rounds_by_instruction = false;

template <class R, class... Ls, class Results, class Mode, class Rule, class... Units>
[[gnu::always_inline]] inline HostResult on_unit(const Mode& mode, Results& results, Rule rule,
                                                 const Units*... operands) {
  if constexpr (Results::is_predicated)
    return on_host<R, Ls...>(mode, results, rule, EnabledLanes<Ls>(operands, results).lane...);
  else
    return on_host<R, Ls...>(mode, results, rule, operands...);
}
template <class R, class From, class Results, class Units>
[[gnu::always_inline]] inline HostResult truncated_on_unit(Results& results, word scale, const Units* operand) {
  return truncated_on_host<R, From>(results, scale, operand);
}
#endif

}  // namespace

#endif
