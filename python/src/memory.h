// The memory of an access: a buffer of Python, and the test that keeps accesses within.
#ifndef KASTARRI_PYTHON_MEMORY_H
#define KASTARRI_PYTHON_MEMORY_H

#include <cstdint>

#include "images.h"
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
    const bool writes = parameter.second & 1;
    if (PyObject_GetBuffer(object, &buffer_, writes ? PyBUF_WRITABLE : PyBUF_SIMPLE) < 0) {
      PyErr_Clear();
      raise(PyExc_TypeError, "%s: memory is an array or another buffer whose bytes lie one behind the other%s",
            row.name, writes ? ", and may be written" : "");
    }
    row_ = row.name;
    alignment_ = parameter.first;
    rounding_ = parameter.second & 2 ? type.bytes : 1;
    size_ = type.bytes;
  }

  char* base() const { return static_cast<char*>(buffer_.buf); }

  // An access so many bytes from the base.
  void expect_access(std::int64_t offset) const { expect(offset, size_); }
  // An element of a gather or scatter. With a byte goes the one after it.
  void expect_element(std::int64_t offset) const { expect(offset, size_ == 1 ? 2 : size_); }

 private:
  void expect(std::int64_t offset, int size) const {
    const auto address = reinterpret_cast<std::intptr_t>(buffer_.buf) + offset;
    if (address & (alignment_ - 1))
      raise(PyExc_ValueError, "%s: the address at offset %lld is not a multiple of %d", row_,
            static_cast<long long>(offset), alignment_);
    const std::int64_t first = offset - (address & (rounding_ - 1));
    if (first < 0 || first + size > buffer_.len)
      raise(PyExc_ValueError, "%s: %d bytes at offset %lld are not within the memory of %zd bytes", row_, size,
            static_cast<long long>(first), buffer_.len);
  }

  Py_buffer buffer_ = {};
  const char* row_ = nullptr;
  int alignment_ = 1, rounding_ = 1;  // powers of 2
  int size_ = 0;
};

}  // namespace kastarri_python

#endif
