// Shapes that only memory accesses have: V the register, M what memory holds, P the predicate (frame/shapes.h tells how
// shapes are written).
#ifndef KASTARRI_MEMORY_SHAPES_H
#define KASTARRI_MEMORY_SHAPES_H

// --- Accesses that test an address ------------------------------------------------------------------

#define SIG_load_IP_aligned SIG_load_IP
#define BODY_load_IP_aligned(V, M, K)                      \
  if (!is_aligned(*pointer)) return not_aligned(*pointer); \
  BODY_load_IP(V, M, K)

#define SIG_load_IP_aligned_destination SIG_load_IP
#define BODY_load_IP_aligned_destination(V, M, K) \
  if (!is_aligned(&r)) return not_aligned(&r);    \
  BODY_load_IP(V, M, K)

#define SIG_store_I_aligned SIG_store_I
#define BODY_store_I_aligned(V, M, K)                                                \
  if (!is_aligned(address(base, offset))) return not_aligned(address(base, offset)); \
  BODY_store_I(V, M, K)

#define SIG_store_IP_aligned SIG_store_IP
#define BODY_store_IP_aligned(V, M, K)                     \
  if (!is_aligned(*pointer)) return not_aligned(*pointer); \
  BODY_store_IP(V, M, K)

// --- Gather and scatter: E the element, O the vector of offsets -------------------------------------

#define SIG_gather(SYMBOL, E, O, K) qv_gsr SYMBOL(const E* base, const O& offsets)
#define BODY_gather(E, O, K)                  \
  qv_gsr r;                                   \
  KASTARRI_SEMANTIC(K)(base, offsets._, r._); \
  return r;

#define SIG_gather_T(SYMBOL, E, O, P, K) qv_gsr SYMBOL(const E* base, const O& offsets, const P& p)
#define BODY_gather_T(E, O, P, K)                  \
  qv_gsr r;                                        \
  KASTARRI_SEMANTIC(K)(base, offsets._, r._, p._); \
  return r;

// With an int of which the result does not depend.
#define SIG_gather_V(SYMBOL, E, O, K) qv_gsr SYMBOL(const E* base, const O& offsets, int)
#define BODY_gather_V BODY_gather
#define SIG_gather_V_T(SYMBOL, E, O, P, K) qv_gsr SYMBOL(const E* base, const O& offsets, int, const P& p)
#define BODY_gather_V_T BODY_gather_T

#define SIG_gathered(SYMBOL, V, K) V SYMBOL(const qv_gsr& gathered)
#define BODY_gathered(V, K)              \
  V r;                                   \
  KASTARRI_SEMANTIC(K)(gathered._, r._); \
  return r;

// A part of the destination keeps its lanes.
#define SIG_gathered_part(SYMBOL, V, K) void SYMBOL(V& r, const qv_gsr& gathered)
#define BODY_gathered_part(V, K) KASTARRI_SEMANTIC(K)(gathered._, r._);

#define SIG_scatter(SYMBOL, V, E, O, K) void SYMBOL(const V& v, const E* base, const O& offsets)
#define BODY_scatter(V, E, O, K) KASTARRI_SEMANTIC(K)(v._, offsets._, writable(base));

#define SIG_scatter_T(SYMBOL, V, E, O, P, K) void SYMBOL(const V& v, const E* base, const O& offsets, const P& p)
#define BODY_scatter_T(V, E, O, P, K) KASTARRI_SEMANTIC(K)(v._, offsets._, writable(base), p._);

#define SIG_increment(SYMBOL, E, O, K) void SYMBOL(const E* base, const O& offsets)
#define BODY_increment(E, O, K) KASTARRI_SEMANTIC(K)(offsets._, writable(base));

#define SIG_wait(SYMBOL, NOTHING) NOTHING SYMBOL()
#define BODY_wait(NOTHING)

#endif
