// Loads and stores of one element.
#include "memory/kernels.h"

#include "memory/stamp.h"

// Every lane of the result is the one element in memory.
#define KERNEL_replicate(OP, R, E)                                      \
  template <class Memory, class Out>                                    \
  static inline void KASTARRI_SEMANTIC(OP)(const Memory* from, Out r) { \
    lanes<R::count>(result<R>(r), SAME, Same(Read<E>(from)[0]));        \
  }

#include "memory/elements.def"

#include "frame/stamp_end.h"
