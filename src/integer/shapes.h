// Shapes that only integer vectors have (frame/shapes.h tells how shapes are written).
#ifndef KASTARRI_INTEGER_SHAPES_H
#define KASTARRI_INTEGER_SHAPES_H

// One immediate for all lanes.
#define SIG_a_i_r(SYMBOL, T, K) T SYMBOL(const T& a, immediate i)
#define BODY_a_i_r(T, K)                                \
  T r;                                                  \
  KASTARRI_SEMANTIC(K)(a._, static_cast<word>(i), r._); \
  return r;

#define SIG_a_i_r_T(SYMBOL, T, P, K) void SYMBOL(T& r, const T& a, immediate i, const P& p)
#define BODY_a_i_r_T(T, P, K) KASTARRI_SEMANTIC(K)(a._, static_cast<word>(i), where(r._, p._));

// A value that depends on nothing.
#define SIG_value_r(SYMBOL, T, K) T SYMBOL()
#define BODY_value_r(T, K)   \
  T r;                       \
  KASTARRI_SEMANTIC(K)(r._); \
  return r;

// A whole register to one value, over all lanes or over the enabled ones.
#define SIG_reduce(SYMBOL, R, T, K) R SYMBOL(const T& a)
#define BODY_reduce(R, T, K) BODY_a_r(R, K)

#define SIG_reduce_T(SYMBOL, R, T, P, K) R SYMBOL(const T& a, const P& p)
#define BODY_reduce_T(R, T, P, K)      \
  R r;                                 \
  KASTARRI_SEMANTIC(K)(a._, p._, r._); \
  return r;

// One value and a whole register to one value.
#define SIG_acc_a(SYMBOL, R, T, K) void SYMBOL(R& acc, const T& a)
#define BODY_acc_a(R, T, K) KASTARRI_SEMANTIC(K)(acc._, a._, acc._);

// One lane of a register.
#define SIG_a_i_lane(SYMBOL, R, T, K) R SYMBOL(const T& a, immediate i)
#define BODY_a_i_lane(R, T, K)                          \
  R r;                                                  \
  KASTARRI_SEMANTIC(K)(a._, static_cast<word>(i), r._); \
  return r;

// A predicate, and a result that may be the operand.
#define SIG_a_pr(SYMBOL, P, T, K) void SYMBOL(P& p, T& r, const T& a)
#define BODY_a_pr(P, T, K) KASTARRI_SEMANTIC(K)(a._, p._, r._);

// A predicate from a count of lanes.
#define SIG_n_p(SYMBOL, P, COUNT, K) P SYMBOL(COUNT n)
#define BODY_n_p(P, COUNT, K)   \
  P r;                          \
  KASTARRI_SEMANTIC(K)(n, r._); \
  return r;

#endif
