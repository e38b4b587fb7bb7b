// Shapes of multiplies and packs (frame/shapes.h tells how shapes are written).
#ifndef KASTARRI_MULTIPLY_SHAPES_H
#define KASTARRI_MULTIPLY_SHAPES_H

#define SIG_ab_w(SYMBOL, W, A, B, K) W SYMBOL(const A& a, const B& b)
#define BODY_ab_w(W, A, B, K) BODY_ab_r(W, K)

#define SIG_acc_ab(SYMBOL, W, A, B, K) void SYMBOL(W& acc, const A& a, const B& b)
#define BODY_acc_ab(W, A, B, K) KASTARRI_SEMANTIC(K)(acc._, a._, b._, acc._);

#define SIG_w_r(SYMBOL, R, W, K) R SYMBOL(const W& acc)
#define BODY_w_r(R, W, K)           \
  R r;                              \
  KASTARRI_SEMANTIC(K)(acc._, r._); \
  return r;

#define SIG_w_r_shift(SYMBOL, R, W, COUNT, K) R SYMBOL(const W& acc, COUNT shift)
#define BODY_w_r_shift(R, W, COUNT, K)                        \
  R r;                                                        \
  KASTARRI_SEMANTIC(K)(acc._, static_cast<word>(shift), r._); \
  return r;

#endif
