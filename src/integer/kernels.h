// Forms of semantic functions that integer operations have (frame/stamp.h tells of forms).
#ifndef KASTARRI_INTEGER_KERNELS_H
#define KASTARRI_INTEGER_KERNELS_H

#include "frame/layouts.h"

// Operands and result of one layout.
#define KERNEL_unary(OP, RULE, L) KERNEL_a(OP, L, RULE, L)
#define KERNEL_binary(OP, RULE, L) KERNEL_ab(OP, L, RULE, L, L)

// An immediate count, taken modulo the lane width, that all lanes share.
#define KERNEL_counted(OP, RULE, L) KERNEL_a_count(OP, L, RULE<L::container>, L)

// The same on whole words with several lanes in each: no target shifts bytes, and not every one takes a
// count at run time for halves.
#define KERNEL_packed(OP, RULE, L)                                                                          \
  template <class Units, class Out>                                                                         \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, word count, Out r) {                             \
    using Whole = packed<L>;                                                                                \
    lanes<Whole::count>(result<Whole>(r), RULE<L::bits, typename Whole::container>(count), Read<Whole>(a)); \
  }

namespace {

// A register of lanes of L as words, a scalar as the one unit that it has.
template <class L>
struct packed_layout {
  static constexpr bool scalar = L::count == 1;
  using unit = std::conditional_t<scalar, std::make_unsigned_t<typename L::container>, word>;
  using type = Layout<unit, 8 * sizeof(unit), scalar ? 1 : L::bits * L::count / 32>;
};
template <class L>
using packed = typename packed_layout<L>::type;

}  // namespace

#endif
