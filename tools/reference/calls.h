// Every intrinsic as something to call on operands that lie in memory as images.
#ifndef KASTARRI_TOOLS_REFERENCE_CALLS_H
#define KASTARRI_TOOLS_REFERENCE_CALLS_H

#include <string>
#include <vector>

#include "operands.h"

namespace worked {

enum class Pointer { none, fixed, moving };

// What a parameter or a result is.
struct Kind {
  View view;
  Role role;
  Pointer pointer;
};

using Function = void (*)();

// A type of function: one for many intrinsics.
struct Signature {
  const Kind* kinds;  // of the parameters, and of the result as the last if there is one
  std::size_t count;
  bool has_result;
  void (*call)(Function, unsigned char* const* images);
};

struct Row {
  const char* name;
  const char* prototype;
  const char* shape;
  Function function;
  Signature signature;
  int most_calls;
};

const std::vector<Row>& rows();

// A row's operands, which lie where the call finds them: what passes them in images, in memory what is pointed to.
// There is one call at a time.
struct Call {
  Call(const Row& row, unsigned char* memory);
  Call(const Call&) = delete;

  void make() { signature.call(function, passed.data()); }

  Function function;
  const Signature& signature;
  std::vector<Operand> operands;
  std::vector<unsigned char*> passed;
};

Operand* find(std::vector<Operand>& operands, const char* name);

// Gives every port handlers that tell what they do.
void open_ports(void (*note)(const char* event, unsigned value));

}  // namespace worked

#endif
