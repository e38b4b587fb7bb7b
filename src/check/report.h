// What an access is told to, before it happens.
#ifndef KASTARRI_CHECK_REPORT_H
#define KASTARRI_CHECK_REPORT_H

#include <cstddef>

namespace check {

#define KASTARRI_OF_CHECKER __attribute__((visibility("hidden")))

// The library's function, of a row's name.
KASTARRI_OF_CHECKER void* find(const char* row);

// Whether accesses count that no result depends on: lanes of a vector that a predicate disables, and the byte after an
// element of 8 bits.
KASTARRI_OF_CHECKER bool all_bytes();

// Reports an access to bytes that are not the program's.
KASTARRI_OF_CHECKER void touch(const char* row, const void* at, std::size_t bytes, bool writes);

}  // namespace check

#endif
