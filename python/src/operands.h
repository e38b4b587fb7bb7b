// Arguments of Python as operands, and arrays for results.
#ifndef KASTARRI_PYTHON_OPERANDS_H
#define KASTARRI_PYTHON_OPERANDS_H

#include "images.h"
#include "python.h"
#include "rows.h"

namespace kastarri_python {

constexpr int most_axes = 16;  // before that of the lanes

// Where the values of an operand lie in an array: of each axis the way from one to the next, 0 where there is but one.
struct Operand {
  const Type* type = nullptr;
  Shape shape = {};
  Ref array;  // none: the value below
  alignas(8) char value[8] = {};
  const char* data = nullptr;
  int axes = 0;
  npy_intp lengths[most_axes];
  npy_intp strides[most_axes];
  // Whether the library can read the values where they lie.
  bool is_direct() const;
  // Has the values from now on in that array.
  void take(Ref values);
};

// What makes an array of the right kind of other arguments: a function of Python, coerce(argument, type, row,
// parameter).
extern PyObject* coerce;

void read_operand(Operand& operand, const Row& row, const Parameter& parameter, const Type& type, PyObject* argument);

int read_immediate(const Row& row, const Parameter& parameter, PyObject* argument);

// An array for values of the type, with axes of these lengths before that of the lanes.
Ref new_array(const Type& type, int axes, const npy_intp* lengths, bool cleared);

// The array that the program wants the values in.
Ref given_array(PyObject* out, const Row& row, const Type& type, int axes, const npy_intp* lengths);

int number_of(const Shape& shape);  // the type of NumPy

}  // namespace kastarri_python

#endif
