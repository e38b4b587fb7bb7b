// The shapes of intrinsics: SIG_<shape> is the prototype, BODY_<shape> what the entry does with its
// typed operands: hand their unit arrays to the semantic function K. Columns of a row fill in the types.
//
// A shape's name tells its operands: a, b, c vectors or scalars; r the result; w a wide vector;
// p a predicate; _T predicated, with the destination first and the predicate last.
#ifndef KASTARRI_FRAME_SHAPES_H
#define KASTARRI_FRAME_SHAPES_H

#define KASTARRI_SEMANTIC(K) Function_KOR_rk_zra32_ZRA_##K

// --- Lane-wise operations ---------------------------------------------------------------------------

#define SIG_ab_r(SYMBOL, T, K) T SYMBOL(const T& a, const T& b)
#define BODY_ab_r(T, K)                    \
  T r;                                     \
  KASTARRI_SEMANTIC(K)(a._, b._, r._);     \
  return r;

#define SIG_ab_r_T(SYMBOL, T, P, K) void SYMBOL(T& r, const T& a, const T& b, const P& p)
#define BODY_ab_r_T(T, P, K) KASTARRI_SEMANTIC(K)(a._, b._, where(r._, p._));

#define SIG_ab_p(SYMBOL, P, T, K) P SYMBOL(const T& a, const T& b)
#define BODY_ab_p(P, T, K) BODY_ab_r(P, K)

// --- Multiplies and packs ---------------------------------------------------------------------------

#define SIG_ab_w(SYMBOL, W, A, B, K) W SYMBOL(const A& a, const B& b)
#define BODY_ab_w(W, A, B, K) BODY_ab_r(W, K)

#define SIG_acc_ab(SYMBOL, W, A, B, K) void SYMBOL(W& acc, const A& a, const B& b)
#define BODY_acc_ab(W, A, B, K) KASTARRI_SEMANTIC(K)(acc._, a._, b._, acc._);

#define SIG_w_r(SYMBOL, R, W, K) R SYMBOL(const W& acc)
#define BODY_w_r(R, W, K)                  \
  R r;                                     \
  KASTARRI_SEMANTIC(K)(acc._, r._);        \
  return r;

#define SIG_w_r_shift(SYMBOL, R, W, COUNT, K) R SYMBOL(const W& acc, COUNT shift)
#define BODY_w_r_shift(R, W, COUNT, K)                         \
  R r;                                                         \
  KASTARRI_SEMANTIC(K)(acc._, static_cast<word>(shift), r._);  \
  return r;

// --- Memory: V the register, M what memory holds, P the predicate -----------------------------------
// A post-increment access uses the pointer as it stands, and moves it when all else is done.

#define SIG_load_I(SYMBOL, V, M, K) V SYMBOL(const M* base, int offset)
#define BODY_load_I(V, M, K)                          \
  V r;                                                \
  KASTARRI_SEMANTIC(K)(address(base, offset), r._);   \
  return r;

#define SIG_load_IP(SYMBOL, V, M, K) void SYMBOL(V& r, const M** pointer, int increment)
#define BODY_load_IP(V, M, K)                         \
  const M* const from = *pointer;                     \
  KASTARRI_SEMANTIC(K)(from, r._);                    \
  *pointer = address(from, increment);

#define SIG_load_I_T(SYMBOL, V, M, P, K) V SYMBOL(const M* base, int offset, const P& p)
#define BODY_load_I_T(V, M, P, K)                                  \
  V r;                                                             \
  KASTARRI_SEMANTIC(K)(address(base, offset), clear(r._, p._));    \
  return r;

#define SIG_load_IP_T(SYMBOL, V, M, P, K) void SYMBOL(V& r, const M** pointer, int increment, const P& p)
#define BODY_load_IP_T(V, M, P, K)                    \
  const M* const from = *pointer;                     \
  KASTARRI_SEMANTIC(K)(from, clear(r._, p._));        \
  *pointer = address(from, increment);

#define SIG_store_I(SYMBOL, V, M, K) void SYMBOL(const V& v, const M* base, int offset)
#define BODY_store_I(V, M, K) KASTARRI_SEMANTIC(K)(v._, writable(address(base, offset)));

#define SIG_store_IP(SYMBOL, V, M, K) void SYMBOL(const V& v, M** pointer, int increment)
#define BODY_store_IP(V, M, K)                        \
  M* const to = *pointer;                             \
  KASTARRI_SEMANTIC(K)(v._, to);                      \
  *pointer = address(to, increment);

#define SIG_store_I_T(SYMBOL, V, M, P, K) void SYMBOL(const V& v, const M* base, int offset, const P& p)
#define BODY_store_I_T(V, M, P, K) KASTARRI_SEMANTIC(K)(v._, p._, writable(address(base, offset)));

#define SIG_store_IP_T(SYMBOL, V, M, P, K) void SYMBOL(const V& v, M** pointer, int increment, const P& p)
#define BODY_store_IP_T(V, M, P, K)                   \
  M* const to = *pointer;                             \
  KASTARRI_SEMANTIC(K)(v._, p._, to);                 \
  *pointer = address(to, increment);

// --- Moves and conversions --------------------------------------------------------------------------

#define SIG_move(SYMBOL, T) T SYMBOL(const T& from)
#define BODY_move(T) return from;

#define SIG_rtor(SYMBOL, FROM, TO) TO SYMBOL(const FROM& from)
#define BODY_rtor(FROM, TO)                                       \
  TO r;                                                           \
  convert<layout_of<FROM>, layout_of<TO>>(from._, r._);           \
  return r;

#define SIG_from_host(SYMBOL, H, TO) TO SYMBOL(H value)
#define BODY_from_host(H, TO)                                     \
  TO r;                                                           \
  convert<host_layout<H>, layout_of<TO>>(&value, r._);            \
  return r;

#define SIG_to_host(SYMBOL, FROM, H) H SYMBOL(const FROM& from)
#define BODY_to_host(FROM, H)                                     \
  H value;                                                        \
  convert<layout_of<FROM>, host_layout<H>>(from._, &value);       \
  return value;

#endif
