// The kinds of row that several families have (rows.h). Further ones are in <family>/row_kinds.h.
#ifndef KASTARRI_FRAME_ROW_KINDS_H
#define KASTARRI_FRAME_ROW_KINDS_H

#include "frame/host_ints.h"

#define ROW(OP, SHAPE, ...) ENTRY(rk_zra32_ZRA_##OP, SHAPE, __VA_ARGS__)
#define PROTO(NAME, SHAPE, ...) ENTRY(rk_zra32_##NAME, SHAPE, __VA_ARGS__)

// The addressing modes of a load or store, of the shapes of those that leave the pointer where it is and of those that
// move it.
#define ADDRESSED_ROWS(OP, PLAIN, UPDATING, ...) \
  ROW(OP##_I, PLAIN, __VA_ARGS__)                \
  ROW(OP##_X, PLAIN, __VA_ARGS__)                \
  ROW(OP##_IP, UPDATING, __VA_ARGS__)            \
  ROW(OP##_XP, UPDATING, __VA_ARGS__)

// Accesses that test no alignment.
#define LOAD_ROWS(OP, ...) ADDRESSED_ROWS(OP, load_I, load_IP, __VA_ARGS__)
#define LOAD_ROWS_T(OP, ...) ADDRESSED_ROWS(OP, load_I_T, load_IP_T, __VA_ARGS__)
#define STORE_ROWS(OP, ...) ADDRESSED_ROWS(OP, store_I, store_IP, __VA_ARGS__)
#define STORE_ROWS_T(OP, ...) ADDRESSED_ROWS(OP, store_I_T, store_IP_T, __VA_ARGS__)

// Conversions between registers and from and to host scalars.
#define REGISTER(FROM, TO) PROTO(FROM##_rtor_##TO, rtor, FROM, TO)
#define HOST(NAME, TYPE, TO)                   \
  PROTO(NAME##_rtor_##TO, from_host, TYPE, TO) \
  PROTO(TO##_rtor_##NAME, to_host, TO, TYPE)
#define HOST_BOTH HOST

// Whole-register copies: a type and the kinds of copy that it has.
#define COPIED(T)                                  \
  PROTO(T##_loadi, load_I, T, T, register_load)    \
  PROTO(T##_storei, store_I, T, T, register_store) \
  PROTO(T##_move, move, T)
#define COPIED_IP(T)                              \
  COPIED(T)                                       \
  PROTO(T##_loadip, load_IP, T, T, register_load) \
  PROTO(T##_storeip, store_IP, T, T, register_store)
#define COPIED_EVERYWHERE(T)                       \
  COPIED_IP(T)                                     \
  PROTO(T##_loadx, load_I, T, T, register_load)    \
  PROTO(T##_storex, store_I, T, T, register_store) \
  PROTO(T##_loadxp, load_IP, T, T, register_load)  \
  PROTO(T##_storexp, store_IP, T, T, register_store)

// Conversions between a register and memory of another type, or a host scalar in memory.
#define LOADED(MEM, REG) PROTO(MEM##_mtor_##REG, mtor, REG, MEM)
#define LOADED_HOST(NAME, TYPE, REG) PROTO(NAME##_mtor_##REG, mtor, REG, TYPE)
#define STORED(REG, MEM) PROTO(REG##_rtom_##MEM, rtom, REG, MEM)
#define STORED_HOST(REG, NAME, TYPE) PROTO(REG##_rtom_##NAME, rtom, REG, TYPE)

#endif
