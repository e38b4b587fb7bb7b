// The shapes of intrinsics: SIG_<shape> is the prototype, BODY_<shape> what the entry does with its
// typed operands: hand their unit arrays to the semantic function K. Columns of a row fill in the types.
//
// A shape's name tells its operands: a, b, c vectors or scalars; r the result; w a wide vector;
// p a predicate; _T predicated, with the destination first and the predicate last. Here are those that
// several families have; <family>/shapes.h has those of one.
//
// Tools go by what a name has in it. That of a shape:
//   _T                            predicated
//   load_I, load_IP, store_I ...  base + offset, or a pointer that then moves by increment
//   aligned, aligned_destination  the address of memory is tested, or that of the result
//   mtor, rtom                    the address of a host scalar is rounded down
//   gather, scatter, increment    each lane has an address of its own, base + offsets[i]
// and that of a parameter:
//   r, acc                        read before it is written, but by loads; entries.py of the reference
//                                 lists second results, which are not
//   a, b, c, d                    operands, each with numbers of its own in worked examples
//   p                             the predicate
//   offset, increment, offsets    distances in bytes
#ifndef KASTARRI_FRAME_SHAPES_H
#define KASTARRI_FRAME_SHAPES_H

#define KASTARRI_SEMANTIC(K) Function_KOR_rk_zra32_ZRA_##K

// --- Lane-wise operations ---------------------------------------------------------------------------

#define SIG_a_r(SYMBOL, T, K) T SYMBOL(const T& a)
#define BODY_a_r(T, K)            \
  T r;                            \
  KASTARRI_SEMANTIC(K)(a._, r._); \
  return r;

#define SIG_a_r_T(SYMBOL, T, P, K) void SYMBOL(T& r, const T& a, const P& p)
#define BODY_a_r_T(T, P, K) KASTARRI_SEMANTIC(K)(a._, where(r._, p._));

#define SIG_ab_r(SYMBOL, T, K) T SYMBOL(const T& a, const T& b)
#define BODY_ab_r(T, K)                \
  T r;                                 \
  KASTARRI_SEMANTIC(K)(a._, b._, r._); \
  return r;

#define SIG_ab_r_T(SYMBOL, T, P, K) void SYMBOL(T& r, const T& a, const T& b, const P& p)
#define BODY_ab_r_T(T, P, K) KASTARRI_SEMANTIC(K)(a._, b._, where(r._, p._));

#define SIG_ab_p(SYMBOL, P, T, K) P SYMBOL(const T& a, const T& b)
#define BODY_ab_p(P, T, K) BODY_ab_r(P, K)

// Products: W the accumulator, read and written, A and B the types of the two factors.
#define SIG_acc_ab(SYMBOL, W, A, B, K) void SYMBOL(W& acc, const A& a, const B& b)
#define BODY_acc_ab(W, A, B, K) KASTARRI_SEMANTIC(K)(acc._, a._, b._, acc._);

#define SIG_acc_ab_T(SYMBOL, W, A, P, K) void SYMBOL(W& acc, const A& a, const A& b, const P& p)
#define BODY_acc_ab_T(W, A, P, K) KASTARRI_SEMANTIC(K)(acc._, a._, b._, where(acc._, p._));

// From an accumulator, or a register of another type than the result.
#define SIG_w_r(SYMBOL, R, W, K) R SYMBOL(const W& acc)
#define BODY_w_r(R, W, K)           \
  R r;                              \
  KASTARRI_SEMANTIC(K)(acc._, r._); \
  return r;

// --- Loads and stores: V the register, M what memory holds, P the predicate -------------------------
//
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

// --- Moves and conversions --------------------------------------------------------------------------

#define SIG_move(SYMBOL, T) T SYMBOL(const T& from)
#define BODY_move(T)                            \
  T r;                                          \
  KASTARRI_SEMANTIC(register_load)(&from, r._); \
  return r;

#define SIG_mtor(SYMBOL, REG, MEM) REG SYMBOL(const MEM* base, int offset)
#define BODY_mtor(REG, MEM)                                                                 \
  REG r;                                                                                    \
  convert<memory_layout<MEM>, layout_of<REG>>(element_address(address(base, offset)), r._); \
  return r;

#define SIG_rtom(SYMBOL, REG, MEM) void SYMBOL(const REG& value, const MEM* base, int offset)
#define BODY_rtom(REG, MEM) \
  convert_to_memory<layout_of<REG>, memory_layout<MEM>>(value._, writable(element_address(address(base, offset))));

#define SIG_rtor(SYMBOL, FROM, TO) TO SYMBOL(const FROM& from)
#define BODY_rtor(FROM, TO)                             \
  TO r;                                                 \
  convert<layout_of<FROM>, layout_of<TO>>(from._, r._); \
  return r;

#define SIG_from_host(SYMBOL, H, TO) TO SYMBOL(H value)
#define BODY_from_host(H, TO)                          \
  TO r;                                                \
  convert<host_layout<H>, layout_of<TO>>(&value, r._); \
  return r;

#define SIG_to_host(SYMBOL, FROM, H) H SYMBOL(const FROM& from)
#define BODY_to_host(FROM, H)                               \
  H value;                                                  \
  convert<layout_of<FROM>, host_layout<H>>(from._, &value); \
  return value;

#endif
