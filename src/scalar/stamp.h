// Stamps tables of the scalar core, up to rows_end.h, into functions: the exported symbols themselves, which
// no target dispatches.
#include "frame/entry.h"
#include "kastarri/scalar.h"
#include "scalar/shapes.h"

#define ENTRY(SYMBOL, SHAPE, ...) \
  SIG_##SHAPE(KASTARRI_SYMBOL(SYMBOL), __VA_ARGS__) { BODY_##SHAPE(__VA_ARGS__) }
#define HELPER(NAME, SHAPE, ...) \
  SIG_##SHAPE(cstub_Km_ZNB_Orbis_R5_64k_##NAME, __VA_ARGS__) { BODY_##SHAPE(__VA_ARGS__) }

#include "frame/rows.h"
