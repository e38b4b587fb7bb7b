// Stamps a table of rows into functions: what follows, up to stamp_end.h, is a table whose KERNELs
// become semantic functions and whose rows become entries. The rules it names are defined above.
//
// A semantic function Function_KOR_rk_zra32_ZRA_<OP> works on arrays of units (words, or the smaller
// units of scalars): operands first, result last. A result may be predicated (lanes.h), so the
// predicated form of an operation is the same function.
#include "frame/entry.h"
#include "frame/lanes.h"
#include "frame/memory.h"
#include "frame/shapes.h"

#define KERNEL(OP, FORM, ...) KERNEL_##FORM(OP, __VA_ARGS__)

// Lane i of the result from lane i of the operands: result layout, rule, operand layouts.
#define KERNEL_a(OP, R, RULE, A)                                    \
  template <class Units, class Out>                                 \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Out r) { \
    lanes<R::count>(result<R>(r), RULE, Read<A>(a));                \
  }
#define KERNEL_ab(OP, R, RULE, A, B)                                                  \
  template <class UnitsA, class UnitsB, class Out>                                    \
  static inline void KASTARRI_SEMANTIC(OP)(const UnitsA* a, const UnitsB* b, Out r) { \
    lanes<R::count>(result<R>(r), RULE, Read<A>(a), Read<B>(b));                      \
  }

// Bit i of a predicate from lane i of two operands of one layout: rule, layout.
#define KERNEL_ab_bits(OP, RULE, L)                                                   \
  template <class Units, class Bits>                                                  \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, const Units* b, Bits* r) { \
    lane_bits<L::bits, L::count>(r, RULE, Read<L>(a), Read<L>(b));                    \
  }

// Lane i of the result from lane i of a and a count that all lanes share: result layout, rule, layout.
#define KERNEL_a_count(OP, R, RULE, A)                                          \
  template <class Units, class Out>                                             \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, word count, Out r) { \
    lanes<R::count>(result<R>(r), RULE(count), Read<A>(a));                     \
  }

#define ENTRY(SYMBOL, SHAPE, ...) \
  KASTARRI_ENTRY SIG_##SHAPE(KASTARRI_SYMBOL(SYMBOL), __VA_ARGS__) { BODY_##SHAPE(__VA_ARGS__) }

#include "frame/rows.h"

KASTARRI_ENTRIES_BEGIN
