#include "frame/failure.h"

#include <cinttypes>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>

#include "kastarri/state.h"

void kastarri::fail(const char* format, ...) {
  std::va_list values;
  va_start(values, format);
  std::vfprintf(stderr, format, values);
  va_end(values);
  std::exit(1);
}

void kastarri::not_aligned(std::uintptr_t address) {
  fail(
      "Error: The config takes exception when the address of an load/store is unaligned. "
      "The address 0x%" PRIxPTR " is not properly aligned.\n",
      address);
}

void kastarri::end_not_aligned(std::uintptr_t address) { not_aligned(address); }

void cstub_vaddr_not_aligned(unsigned address) { kastarri::not_aligned(address); }
