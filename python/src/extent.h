// What lies between the lowest and the highest byte of arrays and buffers, to tell which may share bytes.
#ifndef KASTARRI_PYTHON_EXTENT_H
#define KASTARRI_PYTHON_EXTENT_H

#include <cstdint>

#include "python.h"

namespace kastarri_python {

struct Extent {
  std::uintptr_t begin = 0, end = 0;
  bool meets(const Extent& other) const { return begin < other.end && other.begin < end; }
};

inline Extent extent_of(const void* bytes, Py_ssize_t count) {
  const auto begin = reinterpret_cast<std::uintptr_t>(bytes);
  return {begin, begin + static_cast<std::uintptr_t>(count)};
}

inline Extent extent_of(PyArrayObject* array) {
  if (PyArray_SIZE(array) == 0) return {};
  Extent extent = extent_of(PyArray_DATA(array), PyArray_ITEMSIZE(array));
  for (int i = 0; i < PyArray_NDIM(array); ++i) {
    const npy_intp way = PyArray_STRIDE(array, i) * (PyArray_DIM(array, i) - 1);
    (way < 0 ? extent.begin : extent.end) += static_cast<std::uintptr_t>(way);
  }
  return extent;
}

}  // namespace kastarri_python

#endif
