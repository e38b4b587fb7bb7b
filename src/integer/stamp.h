// Opens tables of integer vectors that are stamped into functions (frame/stamp.h).
#include "integer/shapes.h"

// Entries that are the exported symbols have to be declared.
#ifndef KASTARRI_NAMESPACE
#include "kastarri/integer.h"
#endif

#include "frame/stamp.h"
