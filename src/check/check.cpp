// The entries behind kastarri-check. The library made of this is loaded before the program's libkastarri, so that calls
// from outside it come to the entries. Each asks the address sanitizer, which the program was built with, whether the
// bytes that the intrinsic is about to touch are the program's, and then calls the intrinsic.
//
// Which bytes those are follows from the type of the row's function (accesses.h). What the sanitizer does not like it
// reports itself, as of an access of the program's own.
#include "check/accesses.h"
#include "families.h"
#include "kastarri.h"

namespace {

constexpr bool contains(std::string_view text, std::string_view part) { return text.find(part) != text.npos; }

template <class F>
struct Checked;
template <class R, class... A>
struct Checked<R (*)(A...)> {
  template <class Row>
  static R call(A... operands) {
    static void* intrinsic;
    void* function = __atomic_load_n(&intrinsic, __ATOMIC_RELAXED);
    if (!function) {
      function = check::find(Row::name);
      __atomic_store_n(&intrinsic, function, __ATOMIC_RELAXED);
    }
    check::Accesses<Row, R, A...>::check(operands...);
    return reinterpret_cast<R (*)(A...)>(function)(operands...);
  }
};

}  // namespace

// The exported symbol leads to the entry when it is first called. A resolver is extern "C", for the attribute names it
// so, and hidden, not static: clang does not see that a static one is used.
#define ENTRY(SYMBOL, SHAPE, ...)                                                                                \
  namespace {                                                                                                    \
  struct SYMBOL {                                                                                                \
    static constexpr const char* name = #SYMBOL;                                                                 \
    static constexpr bool converts = contains(#SHAPE, "mtor") || contains(#SHAPE, "rtom");                       \
    static constexpr int first_lane = contains(#SYMBOL, "T_H") ? 32 : 0;                                         \
  };                                                                                                             \
  }                                                                                                              \
  extern "C" __attribute__((visibility("hidden"))) decltype(&KASTARRI_SYMBOL(SYMBOL)) kastarri_check_##SYMBOL(); \
  extern "C" decltype(&KASTARRI_SYMBOL(SYMBOL)) kastarri_check_##SYMBOL() {                                      \
    return &Checked<decltype(&KASTARRI_SYMBOL(SYMBOL))>::call<SYMBOL>;                                           \
  }                                                                                                              \
  SIG_##SHAPE(KASTARRI_SYMBOL(SYMBOL), __VA_ARGS__) __attribute__((ifunc("kastarri_check_" #SYMBOL)));

#include "frame/rows.h"

#include "rows.def"
#include "scalar_rows.def"

#include "frame/rows_end.h"
