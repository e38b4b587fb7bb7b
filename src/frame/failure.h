// How the library fails: where the core would trap, or a port is used without its handlers, one line goes
// to the standard error stream and the program ends with exit status 1.
#ifndef KASTARRI_FRAME_FAILURE_H
#define KASTARRI_FRAME_FAILURE_H

#include <cstdint>

namespace kastarri {

// Hidden, so that a caller needs nothing set up for the call before it knows that it fails.
#define KASTARRI_FAILURE __attribute__((cold, noreturn, visibility("hidden")))

KASTARRI_FAILURE void fail(const char* format, ...) __attribute__((format(printf, 1, 2)));

// What the exported cstub_vaddr_not_aligned does.
KASTARRI_FAILURE void not_aligned(std::uintptr_t address);

// The same, made for `return end_not_aligned(a);` at the end of an entry: that compiles to a jump, so that the entry
// sets up no stack frame for it. Hence the address in a register, and no noreturn: compilers make no such jump to a
// function that never returns.
#ifdef __i386__
#define KASTARRI_IN_REGISTER __attribute__((regparm(1)))
#else
#define KASTARRI_IN_REGISTER  // as every first argument
#endif
KASTARRI_IN_REGISTER __attribute__((cold, visibility("hidden"))) void end_not_aligned(std::uintptr_t address);

}  // namespace kastarri

#endif
