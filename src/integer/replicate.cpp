// One value in every lane, and a lane alone.
#include <cstring>

#include "frame/lanes.h"

#include "integer/stamp.h"

// The lane is read before any is written, for the vector may be the result.
#define KERNEL_replicate(OP, L)                                                  \
  template <class Units, class Out>                                              \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, word number, Out r) { \
    const auto chosen = Read<L>(a)[static_cast<int>(number % L::count)];         \
    lanes<L::count>(                                                             \
        result<L>(r), [chosen](int) { return chosen; }, Same(0));                \
  }
#define KERNEL_selected(OP, L)                                                     \
  template <class Units, class Unit>                                               \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* a, word number, Unit* r) { \
    Write<L>(r).put(0, Read<L>(a)[static_cast<int>(number % L::count)]);           \
  }
// In pieces of 64 bytes at most. For longer ones compilers choose a string instruction, which is slow to start.
#define KERNEL_filled(OP, BYTE)                                          \
  template <class Unit, std::size_t units>                               \
  static inline void KASTARRI_SEMANTIC(OP)(Unit(&r)[units]) {            \
    constexpr std::size_t size = sizeof r < 64 ? sizeof r : 64;          \
    for (std::size_t at = 0; at < sizeof r; at += size) {                \
      std::memset(reinterpret_cast<unsigned char*>(r) + at, BYTE, size); \
      asm volatile("" : : : "memory");                                   \
    }                                                                    \
  }

#include "integer/replicate.def"

#include "frame/stamp_end.h"
