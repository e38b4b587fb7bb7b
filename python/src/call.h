// Calls of intrinsics on arrays.
#ifndef KASTARRI_PYTHON_CALL_H
#define KASTARRI_PYTHON_CALL_H

#include "python.h"
#include "rows.h"

namespace kastarri_python {

// out is None or an array for the first result.
PyObject* call(const Row& row, PyObject* out, PyObject* const* arguments, Py_ssize_t count);

}  // namespace kastarri_python

#endif
