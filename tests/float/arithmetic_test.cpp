#include "float/drivers.h"

#define KASTARRI_TEST_SUITE "float_arithmetic"
#include "float/drivers_begin.h"

#include "float/arithmetic.def"
#include "float/compare.def"

#include "support/drivers_end.h"
