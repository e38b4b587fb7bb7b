// Single products: one product a lane.
#include "multiply/products.h"

#include "frame/stamp.h"

#include "multiply/products.def"

#include "frame/stamp_end.h"
