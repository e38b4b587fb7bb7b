// Every intrinsic as something to call on blocks of operands.
#ifndef KASTARRI_PYTHON_ROWS_H
#define KASTARRI_PYTHON_ROWS_H

#include <cstddef>

#include "types.h"

namespace kastarri_python {

// What a parameter is in a call from Python. The two numbers of a parameter are
//   of an immediate: the lowest and the highest value,
//   of memory: what an address has to be a multiple of; bit 0 the access writes, bit 1 the address is rounded down,
//   of a predicate of elements: the bit that governs the first.
enum class Role {
  input,
  immediate,
  ignored,  // a number on which nothing depends
  kept,     // read and written
  written,
  result,
  memory,   // a pointer, which an offset or offsets are added to
  moving,   // a pointer to a pointer
  offset,   // in bytes
  offsets,  // of elements
  enabled,  // predicate of the elements
};

struct Parameter {
  const char* name;
  Role role;
  int first, second;
};

constexpr int most_parameters = 12;

using Function = void (*)();

// A type of function: one for many intrinsics. Of a pointer it has the type of what is pointed to.
struct Signature {
  const Type* const* types;  // of the parameters, and of the result as the last if there is one
  int count;
  // Calls the function n times. Image i is where the value of parameter i lies, of a pointer the pointer; each call
  // finds it a stride further.
  void (*call)(Function, char* const* images, const std::ptrdiff_t* strides, std::ptrdiff_t n);
};

struct Row {
  const char* name;
  Function function;
  const Signature* signature;
  bool divides;  // and would raise the host's division fault
  Parameter parameters[most_parameters];
};

extern const Row rows[];
extern const int row_count;

}  // namespace kastarri_python

#endif
