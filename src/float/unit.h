// The unit that whole vectors are computed on: AVX-512's, or else the host's as its control word has it.
//
// A unit takes `rules` on floats. What a rule's operands are is up to the unit, which knows for them
//
//   -x                        with its sign turned
//   sum<F>(x, y)              x + y in the format F
//   product<F>(x, y)          x * y
//   fused<F>(acc, x, y)       acc + x * y, rounded once
//   integral(mode, x)         x rounded to an integer by a Rounding or TiesAway; rules that use it take the mode first
//   exact_single_of(x)        x, a number of either format
//   scaled_single(n, power)   n * power, an integer and a power of two
//
// Every unit offers
//
//   store_by_rule<R, Ls...>(out, mode, tells_inexact, rule, exact, operands...)
//     Result lane i, of layout R, from lane i of the operands, of layouts Ls, by the rule, rounded by the mode. Raises
//     inexact where that is wanted. Where lanes are special (NaNs, overflow, tiny results), exact(lane i of operands)
//     yields the result and raises its flags.
//
//   store_truncated<R, From>(out, scale, exact, operand)
//     Numbers times 2^scale, truncated to integers of layout R; inexact and special lanes alike.
//
//   rounds_by_instruction
//     Whether one lane is computed quicker on the unit than by the reference.
//
// `out` is a register, or one under a predicate: then lanes that are not enabled are kept and raise nothing. It may lie
// where an operand does. RoundMode and StickyFlags are the core's; the host's control word and its flags are found as
// they were left, and do not count.
#ifndef KASTARRI_FLOAT_UNIT_H
#define KASTARRI_FLOAT_UNIT_H

#ifdef __AVX512F__
#include "float/avx512.h"
#else
#include "float/host.h"
#endif

#endif
