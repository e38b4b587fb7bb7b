// Shapes of multiplies and packs (frame/shapes.h tells how shapes are written): w fresh wide vector, acc
// accumulator read and written; s, t, u, v words of coefficients after the vectors.
#ifndef KASTARRI_MULTIPLY_SHAPES_H
#define KASTARRI_MULTIPLY_SHAPES_H

// --- Vectors: W the result, A and B the types of the two factors of a product ------------------------

#define SIG_ab_w(SYMBOL, W, A, B, K) W SYMBOL(const A& a, const B& b)
#define BODY_ab_w(W, A, B, K) BODY_ab_r(W, K)

#define SIG_abc_w(SYMBOL, W, A, B, K) W SYMBOL(const A& a, const B& b, const B& c)
#define BODY_abc_w(W, A, B, K) FRESH(W, K, a._, b._, c._)

#define SIG_acc_abc(SYMBOL, W, A, B, K) void SYMBOL(W& acc, const A& a, const B& b, const B& c)
#define BODY_acc_abc(W, A, B, K) KASTARRI_SEMANTIC(K)(acc._, a._, b._, c._, acc._);

#define SIG_abcd_w(SYMBOL, W, A, B, K) W SYMBOL(const A& a, const B& b, const A& c, const B& d)
#define BODY_abcd_w(W, A, B, K) FRESH(W, K, a._, b._, c._, d._)

#define SIG_acc_abcd(SYMBOL, W, A, B, K) void SYMBOL(W& acc, const A& a, const B& b, const A& c, const B& d)
#define BODY_acc_abcd(W, A, B, K) KASTARRI_SEMANTIC(K)(acc._, a._, b._, c._, d._, acc._);

#define FRESH(W, K, ...)                  \
  W r;                                    \
  KASTARRI_SEMANTIC(K)(__VA_ARGS__, r._); \
  return r;

// --- Vectors of type V and words of coefficients -----------------------------------------------------
//
// A semantic function gets the word in whose bytes the reference points (multiply/taps.h).

#define WORD(S) const qv_int32pr& S
#define SLOT(S) word_around(&S)

#define SIG_as_w(SYMBOL, W, V, K) W SYMBOL(const V& a, WORD(s))
#define BODY_as_w(W, V, K) FRESH(W, K, a._, SLOT(s))
#define SIG_acc_as(SYMBOL, W, V, K) void SYMBOL(W& acc, const V& a, WORD(s))
#define BODY_acc_as(W, V, K) KASTARRI_SEMANTIC(K)(acc._, a._, SLOT(s), acc._);

#define SIG_abs_w(SYMBOL, W, V, K) W SYMBOL(const V& a, const V& b, WORD(s))
#define BODY_abs_w(W, V, K) FRESH(W, K, a._, b._, SLOT(s))
#define SIG_acc_abs(SYMBOL, W, V, K) void SYMBOL(W& acc, const V& a, const V& b, WORD(s))
#define BODY_acc_abs(W, V, K) KASTARRI_SEMANTIC(K)(acc._, a._, b._, SLOT(s), acc._);

#define ABCD(V) const V &a, const V &b, const V &c, const V &d

#define SIG_abcds_w(SYMBOL, W, V, K) W SYMBOL(ABCD(V), WORD(s))
#define BODY_abcds_w(W, V, K) FRESH(W, K, a._, b._, c._, d._, SLOT(s))
#define SIG_acc_abcds(SYMBOL, W, V, K) void SYMBOL(W& acc, ABCD(V), WORD(s))
#define BODY_acc_abcds(W, V, K) KASTARRI_SEMANTIC(K)(acc._, a._, b._, c._, d._, SLOT(s), acc._);

#define SIG_abcdst_w(SYMBOL, W, V, K) W SYMBOL(ABCD(V), WORD(s), WORD(t))
#define BODY_abcdst_w(W, V, K) FRESH(W, K, a._, b._, c._, d._, SLOT(s), SLOT(t))
#define SIG_acc_abcdst(SYMBOL, W, V, K) void SYMBOL(W& acc, ABCD(V), WORD(s), WORD(t))
#define BODY_acc_abcdst(W, V, K) KASTARRI_SEMANTIC(K)(acc._, a._, b._, c._, d._, SLOT(s), SLOT(t), acc._);

#define SIG_abcdstuv_w(SYMBOL, W, V, K) W SYMBOL(ABCD(V), WORD(s), WORD(t), WORD(u), WORD(v))
#define BODY_abcdstuv_w(W, V, K) FRESH(W, K, a._, b._, c._, d._, SLOT(s), SLOT(t), SLOT(u), SLOT(v))
#define SIG_acc_abcdstuv(SYMBOL, W, V, K) void SYMBOL(W& acc, ABCD(V), WORD(s), WORD(t), WORD(u), WORD(v))
#define BODY_acc_abcdstuv(W, V, K) \
  KASTARRI_SEMANTIC(K)(acc._, a._, b._, c._, d._, SLOT(s), SLOT(t), SLOT(u), SLOT(v), acc._);

// --- Packs -------------------------------------------------------------------------------------------

// One count for all lanes, of the scalar type COUNT.
#define SIG_w_r_shift(SYMBOL, R, W, COUNT, K) R SYMBOL(const W& acc, COUNT shift)
#define BODY_w_r_shift(R, W, COUNT, K)                        \
  R r;                                                        \
  KASTARRI_SEMANTIC(K)(acc._, static_cast<word>(shift), r._); \
  return r;

// A count a lane, in the vector COUNTS.
#define SIG_w_r_counts(SYMBOL, R, W, COUNTS, K) R SYMBOL(const W& acc, const COUNTS& shift)
#define BODY_w_r_counts(R, W, COUNTS, K)     \
  R r;                                       \
  KASTARRI_SEMANTIC(K)(acc._, shift._, r._); \
  return r;

#endif
