// Opens tables of vector memory that are stamped into functions (frame/stamp.h).
#include "memory/row_kinds.h"
#include "memory/shapes.h"

// Entries that are the exported symbols have to be declared.
#ifndef KASTARRI_NAMESPACE
#include "kastarri/memory.h"
#endif

#include "frame/stamp.h"
