// Forms of semantic functions of the family (frame/stamp.h tells how they are used).
#ifndef KASTARRI_FLOAT_KERNELS_H
#define KASTARRI_FLOAT_KERNELS_H

// Lane i of the result from lane i of the operands, with flags: operation, layout.
#define KERNEL_float_a(OP, RULE, L)                                 \
  template <class Units, class Out>                                 \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Out r) { \
    apply<L, RULE>(r, a);                                           \
  }
#define KERNEL_float_ab(OP, RULE, L)                                                \
  template <class Units, class Out>                                                 \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, const Units* b, Out r) { \
    apply<L, RULE>(r, a, b);                                                        \
  }
#define KERNEL_float_abc(OP, RULE, L)                                                               \
  template <class Units, class Out>                                                                 \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, const Units* b, const Units* c, Out r) { \
    apply<L, RULE>(r, a, b, c);                                                                     \
  }
#define KERNEL_float_ab_bits(OP, RULE, L)                                             \
  template <class Units, class Bits>                                                  \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, const Units* b, Bits* r) { \
    compare<L, RULE>(r, a, b);                                                        \
  }
// Bits only, without flags: operation, layout of operand and result.
#define KERNEL_float_bits(OP, RULE, L)                              \
  template <class Units, class Out>                                 \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Out r) { \
    lanes<L::count>(result<L>(r), bits_rule<RULE, L>, Read<L>(a));  \
  }
#define KERNEL_float_const(OP, UNUSED, L)                                   \
  template <class Out>                                                      \
  static inline void KASTARRI_SEMANTIC(OP)(word number, Out r) {            \
    lanes<L::count>(                                                        \
        result<L>(r), [](word x) { return x; }, Same(constant<L>(number))); \
  }

// Every lane by value into another layout: from, to.
#define KERNEL_convert(OP, FROM, TO)                                 \
  template <class Units, class Out>                                  \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, Out* r) { \
    convert_register<FROM, TO>(r, a, 0);                             \
  }

#endif
