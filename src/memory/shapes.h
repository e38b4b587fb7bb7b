// Shapes of loads and stores: V the register, M what memory holds, P the predicate (frame/shapes.h tells how shapes are
// written).
#ifndef KASTARRI_MEMORY_SHAPES_H
#define KASTARRI_MEMORY_SHAPES_H

// A post-increment access uses the pointer as it stands, and moves it when all else is done.

#define SIG_load_I(SYMBOL, V, M, K) V SYMBOL(const M* base, int offset)
#define BODY_load_I(V, M, K)                        \
  V r;                                              \
  KASTARRI_SEMANTIC(K)(address(base, offset), r._); \
  return r;

#define SIG_load_IP(SYMBOL, V, M, K) void SYMBOL(V& r, const M** pointer, int increment)
#define BODY_load_IP(V, M, K)      \
  const M* const from = *pointer;  \
  KASTARRI_SEMANTIC(K)(from, r._); \
  *pointer = address(from, increment);

#define SIG_load_I_T(SYMBOL, V, M, P, K) V SYMBOL(const M* base, int offset, const P& p)
#define BODY_load_I_T(V, M, P, K)                               \
  V r;                                                          \
  KASTARRI_SEMANTIC(K)(address(base, offset), clear(r._, p._)); \
  return r;

#define SIG_load_IP_T(SYMBOL, V, M, P, K) void SYMBOL(V& r, const M** pointer, int increment, const P& p)
#define BODY_load_IP_T(V, M, P, K)             \
  const M* const from = *pointer;              \
  KASTARRI_SEMANTIC(K)(from, clear(r._, p._)); \
  *pointer = address(from, increment);

#define SIG_store_I(SYMBOL, V, M, K) void SYMBOL(const V& v, const M* base, int offset)
#define BODY_store_I(V, M, K) KASTARRI_SEMANTIC(K)(v._, writable(address(base, offset)));

#define SIG_store_IP(SYMBOL, V, M, K) void SYMBOL(const V& v, M** pointer, int increment)
#define BODY_store_IP(V, M, K)   \
  M* const to = *pointer;        \
  KASTARRI_SEMANTIC(K)(v._, to); \
  *pointer = address(to, increment);

#define SIG_store_I_T(SYMBOL, V, M, P, K) void SYMBOL(const V& v, const M* base, int offset, const P& p)
#define BODY_store_I_T(V, M, P, K) KASTARRI_SEMANTIC(K)(v._, p._, writable(address(base, offset)));

#define SIG_store_IP_T(SYMBOL, V, M, P, K) void SYMBOL(const V& v, M** pointer, int increment, const P& p)
#define BODY_store_IP_T(V, M, P, K)   \
  M* const to = *pointer;             \
  KASTARRI_SEMANTIC(K)(v._, p._, to); \
  *pointer = address(to, increment);

#endif
