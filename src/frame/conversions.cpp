// Moves and conversions between register types, and from and to host scalars.
#include "frame/convert.h"

#include "frame/stamp.h"

#include "frame/conversions.def"
#include "frame/moves.def"

#include "frame/stamp_end.h"
