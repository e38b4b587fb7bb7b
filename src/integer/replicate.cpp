// One value in every lane.
#include <cstring>

#include "frame/lanes.h"

namespace {

constexpr auto SAME = [](auto lane) { return lane; };

}  // namespace

#include "frame/stamp.h"

// The lane is read before any is written, for the vector may be the result.
#define KERNEL_replicate(OP, L)                                                          \
  template <class Units, class Out>                                                      \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, word number, Out r) {         \
    lanes<L::count>(result<L>(r), SAME, Same(Read<L>(a)[number % L::count]));            \
  }
#define KERNEL_filled(OP, BYTE)                                 \
  template <class Unit, std::size_t units>                     \
  static inline void KASTARRI_SEMANTIC(OP)(Unit (&r)[units]) { \
    std::memset(r, BYTE, sizeof r);                               \
  }

#include "integer/replicate.def"

#include "frame/stamp_end.h"
