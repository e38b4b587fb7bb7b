// Vector loads and stores, and loads of one element into every lane.
#include <cstring>

#include "frame/lanes.h"

namespace {

constexpr auto SAME = [](auto lane) { return lane; };

// A predicated store of a whole image: bits of memory change only in enabled lanes, and memory is not
// touched at all when there is none. Otherwise every word is read and written back.
template <class L, class Units, class PredicateUnit, class Memory>
inline void store_where(const Units* v, const PredicateUnit* p, Memory* to) {
  bool any = false;
  bool all = true;
  constexpr int units = (L::count + 31) / 32;
  for (int u = 0; u < units; ++u) {
    any = any || p[u] != 0;
    all = all && p[u] == static_cast<PredicateUnit>(-1);
  }
  if (!any) return;
  if (all) {
    std::memcpy(to, v, L::count * sizeof(typename L::container));
  } else {
    lanes<L::count>(result<L>(where(to, p)), SAME, Read<L>(v));
  }
}

}  // namespace

#include "frame/stamp.h"

// Every lane of the result is the one element in memory.
#define KERNEL_replicate(OP, R, E)                                      \
  template <class Memory, class Out>                                    \
  static inline void KASTARRI_SEMANTIC(OP)(const Memory* from, Out r) { \
    lanes<R::count>(result<R>(r), SAME, Same(Read<E>(from)[0]));        \
  }
#define KERNEL_store_where(OP, L)                                                                \
  template <class Units, class PredicateUnit, class Memory>                                      \
  static inline void KASTARRI_SEMANTIC(OP)(const Units* v, const PredicateUnit* p, Memory* to) { \
    store_where<L>(v, p, to);                                                                    \
  }

#include "memory/vectors.def"

#include "frame/stamp_end.h"
