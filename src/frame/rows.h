// The kinds of row. Each is one exported intrinsic, ENTRY(symbol, shape, columns of the shape ...), or
// several of them. Who includes a table of rows defines ENTRY first (and KERNEL and DOC where they
// mean something to it); what is not defined here or there is nothing.
//
//   DOC("...")                        the rule in words, for the rows that follow
//   KERNEL(OP, form, layout, rule)    the semantic function of OP (stamp.h)
//   ROW(OP, shape, columns ...)       an instruction of the vector unit
//   PROTO(name, shape, columns ...)   a move or conversion of the vector unit's registers
#ifndef KERNEL
#define KERNEL(...)
#endif
#ifndef DOC
#define DOC(TEXT)
#endif

#define ROW(OP, SHAPE, ...) ENTRY(rk_zra32_ZRA_##OP, SHAPE, __VA_ARGS__)
#define PROTO(NAME, SHAPE, ...) ENTRY(rk_zra32_##NAME, SHAPE, __VA_ARGS__)

// The four addressing modes of a memory operation.
#define LOAD_ROWS(OP, ...)           \
  ROW(OP##_I, load_I, __VA_ARGS__)   \
  ROW(OP##_X, load_I, __VA_ARGS__)   \
  ROW(OP##_IP, load_IP, __VA_ARGS__) \
  ROW(OP##_XP, load_IP, __VA_ARGS__)
#define LOAD_ROWS_T(OP, ...)           \
  ROW(OP##_I, load_I_T, __VA_ARGS__)   \
  ROW(OP##_X, load_I_T, __VA_ARGS__)   \
  ROW(OP##_IP, load_IP_T, __VA_ARGS__) \
  ROW(OP##_XP, load_IP_T, __VA_ARGS__)
#define STORE_ROWS(OP, ...)           \
  ROW(OP##_I, store_I, __VA_ARGS__)   \
  ROW(OP##_X, store_I, __VA_ARGS__)   \
  ROW(OP##_IP, store_IP, __VA_ARGS__) \
  ROW(OP##_XP, store_IP, __VA_ARGS__)
#define STORE_ROWS_T(OP, ...)           \
  ROW(OP##_I, store_I_T, __VA_ARGS__)   \
  ROW(OP##_X, store_I_T, __VA_ARGS__)   \
  ROW(OP##_IP, store_IP_T, __VA_ARGS__) \
  ROW(OP##_XP, store_IP_T, __VA_ARGS__)

// Conversions between registers and from and to host scalars.
#define REGISTER(FROM, TO) PROTO(FROM##_rtor_##TO, rtor, FROM, TO)
#define HOST(NAME, TYPE, TO)                    \
  PROTO(NAME##_rtor_##TO, from_host, TYPE, TO) \
  PROTO(TO##_rtor_##NAME, to_host, TO, TYPE)
#define HOST_BOTH HOST
#define HOST_INTS(TO)               \
  HOST(int8, signed char, TO)       \
  HOST(uint8, unsigned char, TO)    \
  HOST(int16, short, TO)            \
  HOST(uint16, unsigned short, TO)  \
  HOST(int32, int, TO)              \
  HOST(uint32, unsigned int, TO)
