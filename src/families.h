// The shapes and the kinds of row of every table, for who reads rows.def and scalar_rows.def.
#include "frame/row_kinds.h"
#include "frame/shapes.h"

#include "scalar/shapes.h"

#include "memory/row_kinds.h"
#include "memory/shapes.h"

#include "integer/shapes.h"

#include "multiply/shapes.h"

#include "float/row_kinds.h"
#include "float/shapes.h"
