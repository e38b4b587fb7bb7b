// Kinds of row of the memory family: one line stands for the addressing modes of an operation.
#ifndef KASTARRI_MEMORY_ROW_KINDS_H
#define KASTARRI_MEMORY_ROW_KINDS_H

// Elements of 16 bits and more: loads test the destination object, and only when they move the pointer;
// stores test the address of the access.
#define ELEMENT_LOAD_ROWS(OP, ...) ADDRESSED_ROWS(OP, load_I, load_IP_aligned_destination, __VA_ARGS__)
#define ELEMENT_STORE_ROWS(OP, ...) ADDRESSED_ROWS(OP, store_I_aligned, store_IP_aligned, __VA_ARGS__)

// Predicates have two modes. All but the plain load test the address of the access.
#define PREDICATE_LOAD_ROWS(OP, P) \
  ROW(OP##_I, load_I, P, P, OP)    \
  ROW(OP##_IP, load_IP_aligned, P, P, OP)
#define PREDICATE_STORE_ROWS(OP, P)      \
  ROW(OP##_I, store_I_aligned, P, P, OP) \
  ROW(OP##_IP, store_IP_aligned, P, P, OP)

// A gather's plain and predicated forms, each with a twin (_V) that takes one int more.
#define GATHER_ROWS(OP, E, O, P, K) \
  ROW(OP, gather, E, O, K)          \
  ROW(OP##_V, gather_V, E, O, K)    \
  ROW(OP##T, gather_T, E, O, P, K)  \
  ROW(OP##T_V, gather_V_T, E, O, P, K)

#endif
