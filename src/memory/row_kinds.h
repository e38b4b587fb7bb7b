// Kinds of row of the memory family: one line stands for the addressing modes of an operation.
#ifndef KASTARRI_MEMORY_ROW_KINDS_H
#define KASTARRI_MEMORY_ROW_KINDS_H

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

#endif
