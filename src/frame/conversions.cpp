// Moves and conversions: between register types, from and to host scalars, and between registers and memory.
#include <cstring>

#include "frame/convert.h"
#include "frame/registers.h"

#include "frame/stamp.h"

template <class T>
static inline void copy(const void* from, void* to) {
  if constexpr (sizeof(T) % register_bytes == 0)
    copy_registers<sizeof(T)>(from, to);
  else
    std::memcpy(to, from, sizeof(T));
}
template <class T, class Units>
static inline void KASTARRI_SEMANTIC(register_load)(const T* from, Units* r) {
  copy<T>(from, r);
}
template <class T, class Units>
static inline void KASTARRI_SEMANTIC(register_store)(const Units* v, T* to) {
  copy<T>(v, to);
}

#include "frame/conversions.def"
#include "frame/memory_conversions.def"
#include "frame/moves.def"

#include "frame/stamp_end.h"
