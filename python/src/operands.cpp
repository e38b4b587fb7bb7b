#include "operands.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

namespace kastarri_python {

PyObject* coerce = nullptr;

int number_of(const Shape& shape) {
  if (shape.kind == 'b') return NPY_BOOL;
  if (shape.kind == 'f') return shape.element_bytes == 2 ? NPY_FLOAT16 : NPY_FLOAT32;
  const bool is_signed = shape.kind == 'i';
  switch (shape.element_bytes) {
    case 1:
      return is_signed ? NPY_INT8 : NPY_UINT8;
    case 2:
      return is_signed ? NPY_INT16 : NPY_UINT16;
    case 4:
      return is_signed ? NPY_INT32 : NPY_UINT32;
    default:
      return is_signed ? NPY_INT64 : NPY_UINT64;
  }
}

namespace {

bool has_lanes(const Shape& shape) { return shape.elements > 1; }

// An array whose last axis is the lanes of the type, one behind the other.
bool suits(PyObject* object, const Shape& shape) {
  if (!PyArray_Check(object)) return false;
  auto* array = reinterpret_cast<PyArrayObject*>(object);
  if (PyArray_TYPE(array) != number_of(shape) || !PyArray_ISBEHAVED_RO(array)) return false;
  const int axes = PyArray_NDIM(array);
  if (!has_lanes(shape)) return axes <= most_axes;
  return axes > 0 && axes <= most_axes + 1 && PyArray_DIM(array, axes - 1) == shape.elements &&
         (PyArray_STRIDE(array, axes - 1) == shape.element_bytes || PyArray_SIZE(array) == 0);
}

// Numbers that stand alone are read without an array.
bool is_number(PyObject* object, const Shape& shape) {
  return !has_lanes(shape) && shape.kind != 'f' && PyLong_Check(object);
}

void read_number(Operand& operand, const Row& row, const Parameter& parameter, PyObject* object) {
  const Shape& shape = operand.shape;
  int overflow;
  const long long number = PyLong_AsLongLongAndOverflow(object, &overflow);
  const int bits = shape.kind == 'b' ? 1 : 8 * shape.element_bytes - (shape.kind == 'i');
  const long long highest = bits >= 63 ? INT64_MAX : (1ll << bits) - 1, lowest = shape.kind == 'i' ? -highest - 1 : 0;
  if (overflow || number < lowest || number > highest)
    raise(PyExc_ValueError, "%s: %s is %S; %s is from %lld to %lld", row.name, parameter.name, object,
          operand.type->name, lowest, highest);
  std::memcpy(operand.value, &number, sizeof number);
  operand.data = operand.value;
}

}  // namespace

bool Operand::is_direct() const {
  if (!shape.lies_alike()) return false;
  auto alike = reinterpret_cast<std::uintptr_t>(data);
  for (int i = 0; i < axes; ++i) alike |= static_cast<std::uintptr_t>(strides[i]);
  return alike % static_cast<unsigned>(type->unit) == 0;
}

void Operand::take(Ref values) {
  array = std::move(values);
  data = PyArray_BYTES(array.array());
  axes = PyArray_NDIM(array.array()) - has_lanes(shape);
  for (int i = 0; i < axes; ++i) {
    lengths[i] = PyArray_DIM(array.array(), i);
    strides[i] = lengths[i] == 1 ? 0 : PyArray_STRIDE(array.array(), i);
  }
}

void read_operand(Operand& operand, const Row& row, const Parameter& parameter, const Type& type, PyObject* argument) {
  operand.type = &type;
  operand.shape = shape_of(type);
  if (is_number(argument, operand.shape)) return read_number(operand, row, parameter, argument);
  Ref array = suits(argument, operand.shape)
                  ? Ref::to(argument)
                  : Ref::checked(PyObject_CallFunction(coerce, "Osss", argument, type.name, row.name, parameter.name));
  if (!suits(array.get(), operand.shape)) raise(PyExc_ValueError, "%s: %s has too many axes", row.name, parameter.name);
  operand.take(std::move(array));
}

int read_immediate(const Row& row, const Parameter& parameter, PyObject* argument) {
  if (!PyIndex_Check(argument) || PyArray_Check(argument))
    raise(PyExc_TypeError, "%s: %s is an immediate, which is an int", row.name, parameter.name);
  const Ref number = Ref::checked(PyNumber_Index(argument));
  int overflow;
  const long long value = PyLong_AsLongLongAndOverflow(number.get(), &overflow);
  if (overflow || value < parameter.first || value > parameter.second)
    raise(PyExc_ValueError, "%s: %s is %S; the immediate is from %d to %d", row.name, parameter.name, argument,
          parameter.first, parameter.second);
  return static_cast<int>(value);
}

Ref new_array(const Type& type, int axes, const npy_intp* lengths, bool cleared) {
  const Shape shape = shape_of(type);
  npy_intp all[most_axes + 1];
  std::copy(lengths, lengths + axes, all);
  all[axes] = shape.elements;
  const int count = axes + has_lanes(shape), number = number_of(shape);
  return Ref::checked(cleared ? PyArray_ZEROS(count, all, number, 0) : PyArray_EMPTY(count, all, number, 0));
}

Ref given_array(PyObject* out, const Row& row, const Type& type, int axes, const npy_intp* lengths) {
  const Shape shape = shape_of(type);
  bool fits = suits(out, shape);
  auto* array = reinterpret_cast<PyArrayObject*>(out);
  fits = fits && PyArray_ISCARRAY(array) && PyArray_NDIM(array) == axes + has_lanes(shape);
  for (int i = 0; fits && i < axes; ++i) fits = PyArray_DIM(array, i) == lengths[i];
  const Ref wanted = Ref::checked(fits ? PyTuple_New(0) : PyArray_IntTupleFromIntp(axes, lengths));
  if (!fits)
    raise(PyExc_ValueError, "%s: out is a contiguous array of the result's type, with the axes %S before its lanes",
          row.name, wanted.get());
  return Ref::to(out);
}

}  // namespace kastarri_python
