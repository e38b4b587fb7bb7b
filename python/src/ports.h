// The ports, whose handlers are functions of Python.
#ifndef KASTARRI_PYTHON_PORTS_H
#define KASTARRI_PYTHON_PORTS_H

#include "python.h"

namespace kastarri_python {

// Registers with the library handlers that call those of Python.
void open_ports();

// set_handler(name, function): None takes the handler away.
PyObject* set_handler(PyObject* module, PyObject* arguments);

}  // namespace kastarri_python

#endif
