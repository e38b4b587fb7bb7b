// The files into which a profiled program counts. The profiler made them and reads them afterwards, so that counts
// outlive the process however it ends. Each is a page with its header, then block after block; forked and executed
// processes add to it.
#ifndef KASTARRI_PROFILE_FILES_H
#define KASTARRI_PROFILE_FILES_H

#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cstdlib>

namespace profile {

constexpr unsigned page = 4096;

constexpr unsigned in_pages(std::size_t size) { return static_cast<unsigned>((size + page - 1) / page * page); }

// A new part of the file that an environment variable names, which is made longer where it ends before that; null when
// that fails.
inline void* mapped(const char* variable, off_t offset, unsigned size) {
  const char* const path = std::getenv(variable);
  const int file = path ? open(path, O_RDWR | O_CLOEXEC) : -1;
  if (file < 0) return nullptr;
  void* memory = MAP_FAILED;
  if (pwrite(file, "", 1, offset + size - 1) == 1)
    memory = mmap(nullptr, size, PROT_READ | PROT_WRITE, MAP_SHARED, file, offset);
  close(file);
  return memory == MAP_FAILED ? nullptr : memory;
}

// The next block; `blocks` is its number in the header.
inline void* next_block(const char* variable, unsigned& blocks, unsigned size) {
  const unsigned block = __atomic_fetch_add(&blocks, 1, __ATOMIC_RELAXED);
  return mapped(variable, page + static_cast<off_t>(block) * size, size);
}

}  // namespace profile

#endif
