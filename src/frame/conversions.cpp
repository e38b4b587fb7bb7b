// Moves and conversions: between register types, from and to host scalars, and between registers and memory.
#include <cstring>

#include "frame/convert.h"

#include "frame/stamp.h"

template <class T, class Units>
static inline void KASTARRI_SEMANTIC(register_load)(const T* from, Units* r) {
  std::memcpy(r, from, sizeof(T));
}
template <class T, class Units>
static inline void KASTARRI_SEMANTIC(register_store)(const Units* v, T* to) {
  std::memcpy(to, v, sizeof(T));
}

#include "frame/conversions.def"
#include "frame/memory_conversions.def"
#include "frame/moves.def"

#include "frame/stamp_end.h"
