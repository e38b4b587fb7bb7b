// How an example fails: one clear line on stderr, exit status 2, and no half-written file.
#ifndef KASTARRI_EXAMPLES_FAILURE_H
#define KASTARRI_EXAMPLES_FAILURE_H

#include <cstdio>
#include <cstdlib>
#include <exception>
#include <stdexcept>
#include <string>

namespace examples {

// What is wrong with the input or the command line, as a person is told.
class Failure : public std::runtime_error {
  using std::runtime_error::runtime_error;
};

// Runs the example; whatever goes wrong ends as one line on stderr and the exit status.
template <class Main>
int run(const char* program, Main&& main) {
  try {
    return main();
  } catch (const std::bad_alloc&) {
    std::fprintf(stderr, "%s: not enough memory\n", program);
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "%s: %s\n", program, failure.what());
  }
  return 2;
}

}  // namespace examples

#endif
