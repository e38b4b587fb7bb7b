// Addresses of the core on the host: base plus byte offset, unsigned 32-bit, wrapping.
#ifndef KASTARRI_FRAME_MEMORY_H
#define KASTARRI_FRAME_MEMORY_H

#include <cstdint>
#include <cstring>

namespace {

template <class M>
inline M* address(M* base, int offset) {
  return reinterpret_cast<M*>(reinterpret_cast<std::uintptr_t>(base) + static_cast<std::uintptr_t>(offset));
}

// Plain stores take a const pointer, as the core's intrinsics do.
template <class M>
inline M* writable(const M* memory) {
  return const_cast<M*>(memory);
}

}  // namespace

#endif
