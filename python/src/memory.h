// The memory of an access: a buffer of Python, and the test that keeps accesses within.
#ifndef KASTARRI_PYTHON_MEMORY_H
#define KASTARRI_PYTHON_MEMORY_H

#include <cstdint>

#include "extent.h"
#include "python.h"
#include "rows.h"

namespace kastarri_python {

class Memory {
 public:
  Memory() = default;
  Memory(const Memory&) = delete;
  Memory& operator=(const Memory&) = delete;
  ~Memory() {
    if (buffer_.obj) PyBuffer_Release(&buffer_);
  }

  // The parameter is what points to it.
  void open(const Row& row, const Parameter& parameter, const Type& type, PyObject* object) {
    is_written_ = parameter.second & 1;
    // Arrays tell what they hold without a format, which some have none of.
    const int format = PyArray_Check(object) ? PyBUF_SIMPLE : PyBUF_ND | PyBUF_FORMAT;
    if (PyObject_GetBuffer(object, &buffer_, format | (is_written_ ? PyBUF_WRITABLE : 0)) < 0) {
      PyErr_Clear();
      raise(PyExc_TypeError, "%s: memory is an array or another buffer whose bytes lie one behind the other%s",
            row.name, is_written_ ? ", and may be written" : "");
    }
    if (has_objects(object)) raise(PyExc_TypeError, "%s: memory that holds Python objects is not accessed", row.name);
    row_ = row.name;
    alignment_ = static_cast<unsigned>(parameter.first);
    rounding_ = parameter.second & 2 ? static_cast<unsigned>(type.bytes) : 1;
    size_ = type.bytes;
  }

  char* base() const { return static_cast<char*>(buffer_.buf); }
  Extent extent() const { return extent_of(buffer_.buf, buffer_.len); }
  bool is_written() const { return is_written_; }

  // An access so many bytes from the base.
  void expect_access(std::int64_t offset) const { expect(offset, size_); }
  // An element of a gather or scatter. With a byte goes the one after it.
  void expect_element(std::int64_t offset) const { expect(offset, size_ == 1 ? 2 : size_); }

 private:
  // Whether references lie there, which no store may change. Names of fields stand between colons.
  bool has_objects(PyObject* object) const {
    if (PyArray_Check(object)) return PyDataType_REFCHK(PyArray_DESCR(reinterpret_cast<PyArrayObject*>(object)));
    bool in_name = false;
    for (const char* c = buffer_.format ? buffer_.format : ""; *c; ++c) {
      in_name ^= *c == ':';
      if (*c == 'O' && !in_name) return true;
    }
    return false;
  }

  // Sums are modulo 2^64, for an offset is any number of 64 bits.
  void expect(std::int64_t offset, int size) const {
    const auto distance = static_cast<std::uintptr_t>(offset);
    const auto address = reinterpret_cast<std::uintptr_t>(buffer_.buf) + distance;
    if (address & (alignment_ - 1))
      raise(PyExc_ValueError, "%s: the address at offset %lld is not a multiple of %u", row_,
            static_cast<long long>(offset), alignment_);
    const auto first = static_cast<std::int64_t>(distance - (address & (rounding_ - 1)));
    if (first < 0 || first > buffer_.len - size)
      raise(PyExc_ValueError, "%s: %d bytes at offset %lld are not within the memory of %zd bytes", row_, size,
            static_cast<long long>(first), buffer_.len);
  }

  Py_buffer buffer_ = {};
  const char* row_ = nullptr;
  unsigned alignment_ = 1, rounding_ = 1;  // powers of 2
  int size_ = 0;
  bool is_written_ = false;
};

}  // namespace kastarri_python

#endif
