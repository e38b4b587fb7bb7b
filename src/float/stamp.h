// Opens tables of floating point that are stamped into functions (frame/stamp.h).
#include "float/row_kinds.h"
#include "float/shapes.h"

// Entries that are the exported symbols have to be declared.
#ifndef KASTARRI_NAMESPACE
#include "kastarri/float.h"
#endif

#include "frame/stamp.h"
