// The two ways in which an example fails.
#ifndef KASTARRI_EXAMPLES_FAILURE_H
#define KASTARRI_EXAMPLES_FAILURE_H

#include <stdexcept>

namespace examples {

// What is wrong with the input or the command line, as a person is told.
class Failure : public std::runtime_error {
  using std::runtime_error::runtime_error;
};

// A kernel made something else than plain C.
class Difference : public std::runtime_error {
  using std::runtime_error::runtime_error;
};

}  // namespace examples

#endif
