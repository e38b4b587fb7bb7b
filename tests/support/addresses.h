// Addresses on a host of either width, and memory in which mistakes with them show.
#ifndef KASTARRI_TESTS_ADDRESSES_H
#define KASTARRI_TESTS_ADDRESSES_H

#include <sys/mman.h>

#include <cinttypes>
#include <cstdio>
#include <string>

namespace testing_support {

inline std::uintptr_t address_of(const void* p) { return reinterpret_cast<std::uintptr_t>(p); }

// p moved by a step that may wrap, and the other way: moved(moved_back(p, step), step) is p.
template <class M>
M* moved(const void* p, int step) {
  return reinterpret_cast<M*>(address_of(p) + static_cast<std::uintptr_t>(std::intptr_t{step}));
}
template <class M>
M* moved_back(const void* p, int step) {
  return reinterpret_cast<M*>(address_of(p) - static_cast<std::uintptr_t>(std::intptr_t{step}));
}

// New pages that nothing may touch yet, shared with child processes. On a 64-bit host a multiple of 4 GiB lies in
// their middle where there is room: what forgets the upper half of an address there, a carry into it, or the sign of
// an offset, comes out at an address that is not mapped.
inline unsigned char* new_pages(std::size_t size) {
  const auto map = [size](std::uint64_t hint) {
    return static_cast<unsigned char*>(mmap(reinterpret_cast<void*>(static_cast<std::uintptr_t>(hint)), size, PROT_NONE,
                                            MAP_SHARED | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0));
  };
  if (sizeof(void*) < 8) return map(0);
  constexpr std::uint64_t four_gib = std::uint64_t{1} << 32, first = 0x3000;  // above what sanitizers reserve
  for (std::uint64_t n = first; n < first + 16; ++n) {
    const std::uint64_t hint = n * four_gib - size / 2 / 4096 * 4096;
    unsigned char* const pages = map(hint);
    if (address_of(pages) == hint) return pages;
    munmap(pages, size);
  }
  return map(0);
}

// The line that a program ends with at an address that is not aligned.
inline std::string not_aligned_message(std::uintptr_t address) {
  char line[200];
  std::snprintf(line, sizeof line,
                "Error: The config takes exception when the address of an load/store is unaligned. "
                "The address 0x%" PRIxPTR " is not properly aligned.\n",
                address);
  return line;
}

}  // namespace testing_support

#endif
