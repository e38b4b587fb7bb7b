/// Every intrinsic of the core for a program on the PC.
///
/// An intrinsic is one function, cstub_Km_ZNB_Orbis_R5_64k__KOR_<package>_<operation>. A single result is
/// returned by value; register operands are const references; further results and registers that are read
/// and written are references, first in the list; a predicate is last. Memory operands are a typed pointer
/// and an offset in bytes. For the short names of the core's own sources include kastarri/names.h.
///
/// Of a predicated form, T in its name, a lane whose predicate bit is 0 takes no part: arithmetic keeps what the
/// destination has there, a load makes it 0, a store leaves memory as it is. It raises no flag.
///
/// Where an address must be aligned and is not, a line on the standard error stream says so and the program
/// ends with exit status 1; nothing has been written.
///
/// In the rules w is the width of a lane in bits. How the lanes of a register lie, kastarri/types.h says; below
/// each heading stands the table of the sources in which its rules are.
#ifndef KASTARRI_H
#define KASTARRI_H

#include "kastarri/gather.h"
#include "kastarri/library.h"
#include "kastarri/state.h"
#include "kastarri/tables.h"
#include "kastarri/types.h"

#include "kastarri/conversions.h"
#include "kastarri/float.h"
#include "kastarri/integer.h"
#include "kastarri/memory.h"
#include "kastarri/multiply.h"
#include "kastarri/scalar.h"

#endif
