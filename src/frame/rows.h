// Opens a list of tables of rows. Each row is one exported intrinsic, ENTRY(symbol, shape, columns of the
// shape ...), or several of them. Who includes tables defines ENTRY first, and KERNEL and DOC where they
// mean something to it; rows_end.h closes the list.
//
//   DOC("...")                        the rule in words, for the rows that follow
//   KERNEL(OP, form, columns ...)     the semantic function of OP; its form says what the columns are (stamp.h)
//   ROW(OP, shape, columns ...)       an instruction of the vector unit
//   PROTO(name, shape, columns ...)   a move or conversion of the vector unit's registers
//   SCALAR(package, name, result, (parameters), expression)   an instruction of the scalar core
//   HELPER(name, shape, columns ...)  an exported function beside the instructions
//
// Further kinds of row, which stand for several, are in row_kinds.h here and in the families.
#ifndef KERNEL
#define KERNEL(...)
#endif
#ifndef HELPER
#define HELPER(...)
#endif
#ifndef DOC
#define DOC(TEXT)
#endif

#include "frame/row_kinds.h"
