// Moves and conversions: between register types, from and to host scalars, and between registers and memory.
#include <cstring>

#include "frame/convert.h"

namespace {

// The bytes of a register, as words where there are many: a vector at a time.
template <int Bytes>
inline void copy(const void* from, void* to) {
  if constexpr (Bytes % 32 == 0) {
    using words = Layout<word, 32, Bytes / 4>;
    lanes<words::count>(Write<words>(to), same_value, Read<words>(from));
  } else {
    std::memcpy(to, from, Bytes);
  }
}

}  // namespace

#include "frame/stamp.h"

template <class T, class Units>
static inline void KASTARRI_SEMANTIC(register_load)(const T* from, Units* r) {
  copy<sizeof(T)>(from, r);
}
template <class T, class Units>
static inline void KASTARRI_SEMANTIC(register_store)(const Units* v, T* to) {
  copy<sizeof(T)>(v, to);
}

#include "frame/conversions.def"
#include "frame/memory_conversions.def"
#include "frame/moves.def"

#include "frame/stamp_end.h"
