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

// The same for a caller to end in, whose way without failure is then that of a leaf: the address comes in a register,
// and the compiler is not told that nothing returns, for it never ends a function in a call that does not.
#ifdef __i386__
#define KASTARRI_IN_REGISTER __attribute__((regparm(1)))
#else
#define KASTARRI_IN_REGISTER  // as every first argument
#endif
KASTARRI_IN_REGISTER __attribute__((cold, visibility("hidden"))) void end_not_aligned(std::uintptr_t address);

}  // namespace kastarri

#endif
