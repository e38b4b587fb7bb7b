// The scalars of half and single precision, each computed by the reference.
#include "float/convert.h"
#include "float/vectors.h"

namespace {

template <class Op>
struct WithoutFlags {
  template <class F, class... X>
  static word exact(Environment&, X... x) {
    Environment truncating(toward_zero);
    const word r = Op::template exact<F>(truncating, x...);
    truncating.forget();
    return r;
  }
};

constexpr auto IS_TRUE = [](std::uint8_t b) { return (b & 1) != 0; };
constexpr auto IS_FALSE = [](std::uint8_t b) { return (b & 1) == 0; };
constexpr auto IS_ZERO = [](int s) { return s == 0; };
constexpr auto IS_NOT_ZERO = [](int s) { return s != 0; };
constexpr auto IS_NOT_NEGATIVE = [](int s) { return s >= 0; };
constexpr auto IS_NEGATIVE = [](int s) { return s < 0; };

cstub_Km_ZNB_Orbis_R5_64k_states_t& states = cstub_Km_ZNB_Orbis_R5_64k_proc.states;

constexpr auto READ_CONTROL = [] { return (states.StickyEnable & all_flags) << 2 | (states.RoundMode & 3); };
constexpr auto WRITE_CONTROL = [](word value) {
  states.RoundMode = value & 3;
  states.StickyEnable = value >> 2 & all_flags;
};
constexpr auto READ_STATUS = [] { return (states.StickyFlags & all_flags) << 7; };
constexpr auto WRITE_STATUS = [](word value) { states.StickyFlags = value >> 7 & all_flags; };

}  // namespace

#include "float/stamp.h"

#include "float/kernels.h"

// Semantic functions of scalars serve both formats: which one the unit tells.
#define KERNEL_scalar_a(OP, RULE)                                    \
  template <class Unit>                                              \
  static inline void KASTARRI_SCALARFP(OP)(const Unit* a, Unit* r) { \
    apply<layout_of_unit<Unit>, RULE>(r, a);                         \
  }
#define KERNEL_scalar_ab(OP, RULE)                                                  \
  template <class Unit>                                                             \
  static inline void KASTARRI_SCALARFP(OP)(const Unit* a, const Unit* b, Unit* r) { \
    apply<layout_of_unit<Unit>, RULE>(r, a, b);                                     \
  }
#define KERNEL_scalar_abc(OP, RULE)                                                                \
  template <class Unit>                                                                            \
  static inline void KASTARRI_SCALARFP(OP)(const Unit* a, const Unit* b, const Unit* c, Unit* r) { \
    apply<layout_of_unit<Unit>, RULE>(r, a, b, c);                                                 \
  }
#define KERNEL_scalar_abc_to_nearest(OP, RULE)                                                     \
  template <class Unit>                                                                            \
  static inline void KASTARRI_SCALARFP(OP)(const Unit* a, const Unit* b, const Unit* c, Unit* r) { \
    apply<layout_of_unit<Unit>, RULE>(to_nearest, r, a, b, c);                                     \
  }
#define KERNEL_scalar_relation(OP, RULE)                                            \
  template <class Unit, class Bits>                                                 \
  static inline void KASTARRI_SCALARFP(OP)(const Unit* a, const Unit* b, Bits* r) { \
    compare<layout_of_unit<Unit>, RULE>(r, a, b);                                   \
  }
#define KERNEL_scalar_on_bits(OP, RULE)                              \
  template <class From, class To>                                    \
  static inline void KASTARRI_SCALARFP(OP)(const From* a, To* r) {   \
    *r = static_cast<To>(bits_rule<RULE, layout_of_unit<From>>(*a)); \
  }
#define KERNEL_scalar_from_bits(OP, RULE)                                              \
  template <class To>                                                                  \
  static inline void KASTARRI_SCALARFP(OP)(const word* bits, To* r) {                  \
    *r = static_cast<To>(bits_rule<RULE, layout_of_unit<To>>(static_cast<To>(*bits))); \
  }
#define KERNEL_scalar_const(OP, RULE)                               \
  template <class Unit>                                             \
  static inline void KASTARRI_SCALARFP(OP)(word number, Unit * r) { \
    *r = static_cast<Unit>(RULE<layout_of_unit<Unit>>(number));     \
  }
#define KERNEL_scalar_float(OP, I)                                                    \
  template <class Value, class Unit>                                                  \
  static inline void KASTARRI_SCALARFP(OP)(const Value* value, word scale, Unit* r) { \
    convert_register<I, layout_of_unit<Unit>>(r, value, scale_of<I>(scale));          \
  }
#define KERNEL_scalar_trunc(OP, I)                                                    \
  template <class Unit, class Value>                                                  \
  static inline void KASTARRI_SCALARFP(OP)(const Unit* a, word scale, Value* value) { \
    convert_register<layout_of_unit<Unit>, I>(value, a, scale_of<I>(scale));          \
  }
#define KERNEL_scalar_move(OP, CONDITION)                                                        \
  template <class Unit, class Condition>                                                         \
  static inline void KASTARRI_SCALARFP(OP)(const Unit* a, const Condition* condition, Unit* r) { \
    if (CONDITION(*condition)) *r = *a;                                                          \
  }
#define KERNEL_scalar_read(OP, RULE) \
  static inline void KASTARRI_SCALARFP(OP)(word * r) { *r = RULE(); }
#define KERNEL_scalar_write(OP, RULE) \
  static inline void KASTARRI_SCALARFP(OP)(const word* value) { RULE(*value); }

#include "float/scalars.def"

#include "frame/stamp_end.h"
