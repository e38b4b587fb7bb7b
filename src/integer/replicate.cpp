// One value in every lane.
#include <cstring>

#include "frame/lanes.h"

#include "frame/stamp.h"

// The lane is read before any is written, for the vector may be the result.
#define KERNEL_replicate(OP, L)                                                  \
  template <class Units, class Out>                                              \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, word number, Out r) { \
    const auto chosen = Read<L>(a)[static_cast<int>(number % L::count)];         \
    lanes<L::count>(                                                             \
        result<L>(r), [chosen](int) { return chosen; }, Same(0));                \
  }
#define KERNEL_filled(OP, BYTE)                               \
  template <class Unit, std::size_t units>                    \
  static inline void KASTARRI_SEMANTIC(OP)(Unit(&r)[units]) { \
    std::memset(r, BYTE, sizeof r);                           \
  }

#include "integer/replicate.def"

#include "frame/stamp_end.h"
