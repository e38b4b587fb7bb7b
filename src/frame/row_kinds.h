// The kinds of row that stand in tables (rows.h).
#ifndef KASTARRI_FRAME_ROW_KINDS_H
#define KASTARRI_FRAME_ROW_KINDS_H

#include "memory/row_kinds.h"

#define ROW(OP, SHAPE, ...) ENTRY(rk_zra32_ZRA_##OP, SHAPE, __VA_ARGS__)
#define PROTO(NAME, SHAPE, ...) ENTRY(rk_zra32_##NAME, SHAPE, __VA_ARGS__)
#define SCALAR(PACKAGE, NAME, ...) ENTRY(rk_##PACKAGE##_##NAME, scalar, __VA_ARGS__)

// Conversions between registers and from and to host scalars.
#define REGISTER(FROM, TO) PROTO(FROM##_rtor_##TO, rtor, FROM, TO)
#define HOST(NAME, TYPE, TO)                   \
  PROTO(NAME##_rtor_##TO, from_host, TYPE, TO) \
  PROTO(TO##_rtor_##NAME, to_host, TO, TYPE)
#define HOST_BOTH HOST
#define HOST_INTS(TO)              \
  HOST(int8, signed char, TO)      \
  HOST(uint8, unsigned char, TO)   \
  HOST(int16, short, TO)           \
  HOST(uint16, unsigned short, TO) \
  HOST(int32, int, TO)             \
  HOST(uint32, unsigned int, TO)

#endif
