// Registers in arrays of NumPy, and as the library has them.
//
// Most lanes lie in both alike. In arrays a lane of 24 or 48 bits is a number of 64, and a bit of a predicate is a
// byte.
#ifndef KASTARRI_PYTHON_IMAGES_H
#define KASTARRI_PYTHON_IMAGES_H

#include <cstddef>

#include "types.h"

namespace kastarri_python {

enum class Way { same, sum24, sum48, predicate };

// How values of a type lie in arrays: bytes of a value, and what it is made of.
struct Shape {
  Way way;
  char kind;  // i, u, f, b as in Type
  int element_bytes;
  int elements;  // one: no axis of its own
  int bytes() const { return element_bytes * elements; }
  // Whether images lie in arrays. Lanes of 48 bits are extended to 64.
  bool lies_alike() const { return way == Way::same || way == Way::sum48; }
};

Shape shape_of(const Type& type);

// n values from an array into images that lie one behind the other; false if a number does not fit its lane.
bool to_images(const Type& type, const char* array, std::ptrdiff_t stride, std::ptrdiff_t n, char* images);

// Whether the numbers of n values that lie alike fit their lanes.
bool fit(const Type& type, const char* array, std::ptrdiff_t stride, std::ptrdiff_t n);

// n values from images into an array, where they lie one behind the other.
void to_array(const Type& type, const char* images, std::ptrdiff_t n, char* array);

}  // namespace kastarri_python

#endif
