// Shapes of floating-point operations (frame/shapes.h tells how shapes are written).
#ifndef KASTARRI_FLOAT_SHAPES_H
#define KASTARRI_FLOAT_SHAPES_H

// --- Vectors and single lanes ---------------------------------------------------------------------------

#define SIG_float_const(SYMBOL, T, K) T SYMBOL(immediate number)
#define BODY_float_const(T, K)                          \
  T r;                                                  \
  KASTARRI_SEMANTIC(K)(static_cast<word>(number), r._); \
  return r;

#define SIG_float_scaled(SYMBOL, R, A, K) R SYMBOL(const A& a, immediate scale)
#define BODY_float_scaled(R, A, K)                          \
  R r;                                                      \
  KASTARRI_SEMANTIC(K)(a._, static_cast<word>(scale), r._); \
  return r;

// --- Scalars of rk_zran: T is the scalar's type ---------------------------------------------------------

#define KASTARRI_SCALARFP(K) Function_KOR_rk_zran_scalarfp_##K

#define SIG_scalarfp_a_r(SYMBOL, T, K) T SYMBOL(const T& a)
#define BODY_scalarfp_a_r(T, K)   \
  T r;                            \
  KASTARRI_SCALARFP(K)(a._, r._); \
  return r;

#define SIG_scalarfp_ab_r(SYMBOL, T, K) T SYMBOL(const T& a, const T& b)
#define BODY_scalarfp_ab_r(T, K)       \
  T r;                                 \
  KASTARRI_SCALARFP(K)(a._, b._, r._); \
  return r;

#define SIG_scalarfp_acc_ab(SYMBOL, T, K) void SYMBOL(T& acc, const T& a, const T& b)
#define BODY_scalarfp_acc_ab(T, K) KASTARRI_SCALARFP(K)(acc._, a._, b._, acc._);

#define SIG_scalarfp_ra(SYMBOL, T, K) void SYMBOL(T& r, const T& a)
#define BODY_scalarfp_ra(T, K) KASTARRI_SCALARFP(K)(r._, a._, r._);

#define SIG_scalarfp_relation(SYMBOL, T, B, K) B SYMBOL(const T& a, const T& b)
#define BODY_scalarfp_relation(T, B, K) \
  B r;                                  \
  KASTARRI_SCALARFP(K)(a._, b._, r._);  \
  return r;

#define SIG_scalarfp_const(SYMBOL, T, K) T SYMBOL(immediate number)
#define BODY_scalarfp_const(T, K)                       \
  T r;                                                  \
  KASTARRI_SCALARFP(K)(static_cast<word>(number), r._); \
  return r;

#define SIG_scalarfp_to_word(SYMBOL, T, K) unsigned SYMBOL(const T& a)
#define BODY_scalarfp_to_word(T, K) \
  word r;                           \
  KASTARRI_SCALARFP(K)(a._, &r);    \
  return r;

#define SIG_scalarfp_from_word(SYMBOL, T, K) T SYMBOL(unsigned bits)
#define BODY_scalarfp_from_word(T, K) \
  T r;                                \
  KASTARRI_SCALARFP(K)(&bits, r._);   \
  return r;

// From and to a host integer I, and a register I.
#define SIG_scalarfp_from_int(SYMBOL, T, I, K) T SYMBOL(I value, immediate scale)
#define BODY_scalarfp_from_int(T, I, K)                        \
  T r;                                                         \
  KASTARRI_SCALARFP(K)(&value, static_cast<word>(scale), r._); \
  return r;

#define SIG_scalarfp_to_int(SYMBOL, T, I, K) I SYMBOL(const T& a, immediate scale)
#define BODY_scalarfp_to_int(T, I, K)                          \
  I value;                                                     \
  KASTARRI_SCALARFP(K)(a._, static_cast<word>(scale), &value); \
  return value;

#define SIG_scalarfp_scaled(SYMBOL, R, A, K) R SYMBOL(const A& a, immediate scale)
#define BODY_scalarfp_scaled(R, A, K)                       \
  R r;                                                      \
  KASTARRI_SCALARFP(K)(a._, static_cast<word>(scale), r._); \
  return r;

// Moves under a condition: a boolean, an integer.
#define SIG_scalarfp_move_where(SYMBOL, T, K) void SYMBOL(T& r, const T& a, const rkbool& b)
#define BODY_scalarfp_move_where(T, K) KASTARRI_SCALARFP(K)(a._, b._, r._);

#define SIG_scalarfp_move_when(SYMBOL, T, K) void SYMBOL(T& r, const T& a, int condition)
#define BODY_scalarfp_move_when(T, K) KASTARRI_SCALARFP(K)(a._, &condition, r._);

// The control and status registers.
#define SIG_scalarfp_read(SYMBOL, K) unsigned SYMBOL()
#define BODY_scalarfp_read(K) \
  word r;                     \
  KASTARRI_SCALARFP(K)(&r);   \
  return r;

#define SIG_scalarfp_write(SYMBOL, K) void SYMBOL(unsigned value)
#define BODY_scalarfp_write(K) KASTARRI_SCALARFP(K)(&value);

#endif
