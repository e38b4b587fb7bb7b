// The exported symbols of a build for several targets: each is resolved, once, when it is first called
// or the library loaded, to the entry of the best target that the processor runs.
#include "families.h"
#include "frame/entry.h"
#include "frame/processor.h"
#include "kastarri.h"

#define DECLARE(TARGET, SYMBOL, SHAPE, ...)            \
  namespace kastarri_##TARGET {                        \
    SIG_##SHAPE(KASTARRI_SYMBOL(SYMBOL), __VA_ARGS__); \
  }
#define CHOOSE(TARGET, SYMBOL) \
  if (runs_##TARGET()) return &kastarri_##TARGET::KASTARRI_SYMBOL(SYMBOL);

// The type of a resolver is that of the public prototype: rows and headers cannot differ. A resolver is
// extern "C", for the attribute names it so, and hidden, not static: clang does not see that a static
// one is used.
#define ENTRY(SYMBOL, SHAPE, ...)                                                                                  \
  KASTARRI_FOR_TARGETS(DECLARE, SYMBOL, SHAPE, __VA_ARGS__)                                                        \
  extern "C" __attribute__((visibility("hidden"))) decltype(&KASTARRI_SYMBOL(SYMBOL)) kastarri_resolve_##SYMBOL(); \
  extern "C" decltype(&KASTARRI_SYMBOL(SYMBOL)) kastarri_resolve_##SYMBOL() {                                      \
    KASTARRI_FOR_TARGETS(CHOOSE, SYMBOL)                                                                           \
    return nullptr;                                                                                                \
  }                                                                                                                \
  SIG_##SHAPE(KASTARRI_SYMBOL(SYMBOL), __VA_ARGS__) __attribute__((ifunc("kastarri_resolve_" #SYMBOL)));

#include "frame/rows.h"

#include "rows.def"

#include "frame/rows_end.h"
