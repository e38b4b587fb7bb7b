// Opens tables of multiplies and packs that are stamped into functions (frame/stamp.h).
#include "multiply/shapes.h"

// Entries that are the exported symbols have to be declared.
#ifndef KASTARRI_NAMESPACE
#include "kastarri/multiply.h"
#endif

#include "frame/stamp.h"
