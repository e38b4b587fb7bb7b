// How the library fails: where the core would trap, or a port is used without its handlers, one line goes
// to the standard error stream and the program ends with exit status 1.
#ifndef KASTARRI_FRAME_FAILURE_H
#define KASTARRI_FRAME_FAILURE_H

namespace kastarri {

[[noreturn]] void fail(const char* format, ...) __attribute__((cold, format(printf, 1, 2)));

}  // namespace kastarri

#endif
