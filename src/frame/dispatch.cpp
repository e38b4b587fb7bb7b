// The exported symbols of a build for several targets: each is resolved, once, when it is first called
// or the library loaded, to the entry of the best target that the processor runs.
#include <string_view>

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

namespace {

constexpr bool contains(std::string_view text, std::string_view part) { return text.find(part) != text.npos; }

// Rows that compute so much for what they load that 512 bits are the better choice on every processor that has them:
// floats, packs, complex products, sums of four products.
[[maybe_unused]] constexpr bool computes_much(std::string_view table, std::string_view symbol) {
  return contains(table, "src/float/") || contains(table, "src/multiply/pack.def") ||
         contains(table, "src/multiply/complex.def") ||
         (contains(symbol, "_MUL") && contains(symbol, "Q") && !contains(symbol, "PACKQ"));
}

}  // namespace

// AVX2 where it is better although AVX-512 is there. Where one stands in for the other registers are the same bytes.
#define PREFER_avx512(SYMBOL)
#define PREFER_avx2(SYMBOL)                                                                     \
  if constexpr (!computes_much(__FILE__, #SYMBOL)) {                                            \
    if (reloads_halves_sooner() && runs_avx2()) return &kastarri_avx2::KASTARRI_SYMBOL(SYMBOL); \
  }
#define PREFER_sse2(SYMBOL)
#define PREFER(TARGET, SYMBOL) PREFER_##TARGET(SYMBOL)

// The type of a resolver is that of the public prototype: rows and headers cannot differ. A resolver is
// extern "C", for the attribute names it so, and hidden, not static: clang does not see that a static
// one is used.
#define ENTRY(SYMBOL, SHAPE, ...)                                                                                  \
  KASTARRI_FOR_TARGETS(DECLARE, SYMBOL, SHAPE, __VA_ARGS__)                                                        \
  extern "C" __attribute__((visibility("hidden"))) decltype(&KASTARRI_SYMBOL(SYMBOL)) kastarri_resolve_##SYMBOL(); \
  extern "C" decltype(&KASTARRI_SYMBOL(SYMBOL)) kastarri_resolve_##SYMBOL() {                                      \
    KASTARRI_FOR_TARGETS(PREFER, SYMBOL)                                                                           \
    KASTARRI_FOR_TARGETS(CHOOSE, SYMBOL)                                                                           \
    return nullptr;                                                                                                \
  }                                                                                                                \
  SIG_##SHAPE(KASTARRI_SYMBOL(SYMBOL), __VA_ARGS__) __attribute__((ifunc("kastarri_resolve_" #SYMBOL)));

#include "frame/rows.h"

#include "rows.def"

#include "frame/rows_end.h"
