// Python and NumPy, and what makes them usable from C++.
#ifndef KASTARRI_PYTHON_PYTHON_H
#define KASTARRI_PYTHON_PYTHON_H

#define PY_SSIZE_T_CLEAN
#include <Python.h>

#define NPY_NO_DEPRECATED_API NPY_1_7_API_VERSION
#define PY_ARRAY_UNIQUE_SYMBOL kastarri_array_api
#ifndef KASTARRI_PYTHON_IMPORTS_ARRAYS  // one source does
#define NO_IMPORT_ARRAY
#endif
#include <numpy/arrayobject.h>

#include <new>
#include <utility>

namespace kastarri_python {

// Thrown where an exception of Python has been set.
struct Raised {};

template <class... A>
[[noreturn]] void raise(PyObject* exception, const char* format, A... arguments) {
  PyErr_Format(exception, format, arguments...);
  throw Raised();
}

// A reference that is owned.
class Ref {
 public:
  Ref() = default;
  explicit Ref(PyObject* object) : object_(object) {}
  Ref(Ref&& other) noexcept : object_(std::exchange(other.object_, nullptr)) {}
  Ref& operator=(Ref&& other) noexcept {
    std::swap(object_, other.object_);
    return *this;
  }
  ~Ref() { Py_XDECREF(object_); }

  static Ref to(PyObject* borrowed) {
    Py_XINCREF(borrowed);
    return Ref(borrowed);
  }
  // Of what a function of Python returned, which is null if it raised.
  static Ref checked(PyObject* object) {
    if (!object) throw Raised();
    return Ref(object);
  }

  PyObject* get() const { return object_; }
  PyArrayObject* array() const { return reinterpret_cast<PyArrayObject*>(object_); }
  PyObject* release() { return std::exchange(object_, nullptr); }
  explicit operator bool() const { return object_ != nullptr; }

 private:
  PyObject* object_ = nullptr;
};

// What a function of the module does; it may throw Raised.
template <class Body>
PyObject* guarded(Body body) {
  try {
    return body();
  } catch (const Raised&) {
    return nullptr;
  } catch (const std::bad_alloc&) {
    return PyErr_NoMemory();
  }
}

}  // namespace kastarri_python

#endif
