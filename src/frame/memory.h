// Addresses of the core on the host: base plus byte offset, wrapping. The offset is a signed number of 32 bits
// whatever the width of an address: -4 is 4 bytes before the base.
#ifndef KASTARRI_FRAME_MEMORY_H
#define KASTARRI_FRAME_MEMORY_H

#include <cstdint>
#include <cstring>

#include "frame/failure.h"

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

// The core's test of an address: bit 0 is clear for an object of 16 bits, bits 0 and 1 for a wider one. The
// compiler must not see where the address comes from: it may take objects to be aligned, and would drop the test.
template <class M>
inline bool is_aligned(const M* memory) {
  constexpr std::uintptr_t low_bits = sizeof(M) < 4 ? sizeof(M) - 1 : 3;
  auto at = reinterpret_cast<std::uintptr_t>(memory);
  asm("" : "+r"(at));
  return (at & low_bits) == 0;
}

// For a function that returns nothing to end in: return not_aligned(memory);
inline void not_aligned(const void* memory) { kastarri::end_not_aligned(reinterpret_cast<std::uintptr_t>(memory)); }

}  // namespace

#endif
