#include "ports.h"

#include <cstring>

#include "kastarri/state.h"

namespace kastarri_python {

namespace {

enum Handler {
  exported,
  input_ready,
  input_attempt,
  input_read,
  output_ready,
  output_attempt,
  output_write,
  wire,
  handlers
};

constexpr const char* names[handlers] = {"exported",     "input_ready",    "input_attempt", "input_read",
                                         "output_ready", "output_attempt", "output_write",  "wire"};
PyObject* functions[handlers];

// What the handler returns. The library knows no errors: after one, handlers are not called until the intrinsic has
// returned, when it is raised. A handler that is not there is one, too, but for those of attempts.
template <class... A>
Ref ask(Handler handler, const char* format, A... arguments) {
  if (PyErr_Occurred()) return Ref();
  const Ref function = Ref::to(functions[handler]);  // the handler itself may put another in its place
  if (function) return Ref(PyObject_CallFunction(function.get(), format, arguments...));
  if (handler != input_attempt && handler != output_attempt)
    PyErr_Format(PyExc_RuntimeError, "the port has no handler '%s': see kastarri.ports", names[handler]);
  return Ref();
}

unsigned truth(const Ref& answer) { return answer && PyObject_IsTrue(answer.get()) == 1; }

unsigned word(const Ref& answer) {
  if (!answer) return 0;
  const Ref number(PyNumber_Index(answer.get()));
  if (!number) return 0;
  const unsigned long value = PyLong_AsUnsignedLong(number.get());
  if (!PyErr_Occurred() && value > 0xFFFFFFFF) PyErr_SetString(PyExc_ValueError, "a port has 32 bits");
  return PyErr_Occurred() ? 0 : static_cast<unsigned>(value);
}

}  // namespace

void open_ports() {
  cstub_Km_ZNB_Orbis_R5_64k_register_EXPSTATE(
      nullptr, [](const cstub_ExportState_t*, const unsigned* value) { ask(exported, "I", *value); });
  cstub_Km_ZNB_Orbis_R5_64k_register_IPQ(
      nullptr, [](const cstub_InputQueue_t*) { return truth(ask(input_ready, nullptr)); },
      [](const cstub_InputQueue_t*, unsigned flag, unsigned* data) {
        if (flag != 0)
          ask(input_attempt, nullptr);
        else
          *data = word(ask(input_read, nullptr));
      });
  cstub_Km_ZNB_Orbis_R5_64k_register_OPQ(
      nullptr, [](const cstub_OutputQueue_t*) { return truth(ask(output_ready, nullptr)); },
      [](const cstub_OutputQueue_t*, unsigned flag, const unsigned* data) {
        if (flag != 0)
          ask(output_attempt, nullptr);
        else
          ask(output_write, "I", *data);
      });
  cstub_Km_ZNB_Orbis_R5_64k_register_IMPWIRE(
      nullptr, [](const cstub_ImportWire_t*, unsigned* value) { *value = word(ask(wire, nullptr)); });
}

PyObject* set_handler(PyObject*, PyObject* arguments) {
  const char* name;
  PyObject* function;
  if (!PyArg_ParseTuple(arguments, "sO", &name, &function)) return nullptr;
  for (int i = 0; i < handlers; ++i) {
    if (std::strcmp(name, names[i]) != 0) continue;
    Ref before(functions[i]);
    functions[i] = function == Py_None ? nullptr : Ref::to(function).release();
    Py_RETURN_NONE;
  }
  return PyErr_Format(PyExc_ValueError, "no handler is called '%s'", name);
}

}  // namespace kastarri_python
