// Every multiply, and every sum in wide lanes, by its name.
#include "multiply/drivers.h"

#define ENTRY(SYMBOL, SHAPE, ...)                                                                             \
  const int tested_##SYMBOL = testing_support::add_test("multiply", testing_support::operation(#SYMBOL), [] { \
    testing_support::drive_multiply(testing_support::operation(#SYMBOL), &KASTARRI_SYMBOL(SYMBOL));           \
  });

namespace {

#include "frame/rows.h"

#include "multiply/products.def"
#include "multiply/pairs.def"
#include "multiply/squares.def"
#include "multiply/taps.def"
#include "multiply/windows.def"
#include "multiply/mixed16x32.def"
#include "multiply/mixed8x16.def"
#include "multiply/complex.def"
#include "multiply/narrow.def"
#include "multiply/sums.def"

}  // namespace

#include "frame/rows_end.h"
