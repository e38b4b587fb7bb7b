// The extension kastarri._core: what the package has that is compiled.
#define KASTARRI_PYTHON_IMPORTS_ARRAYS
#include <cstring>

#include "call.h"
#include "kastarri/print.h"
#include "kastarri/state.h"
#include "operands.h"
#include "ports.h"

namespace kastarri_python {

namespace {

// --- Types ------------------------------------------------------------------------------------------

#define KASTARRI_LISTED(T, KIND, BITS, COUNT) &TypeOf<T##_space::T##_>::value,
constexpr const Type* register_types[] = {KASTARRI_REGISTER_TYPES(KASTARRI_LISTED)};
#undef KASTARRI_LISTED

constexpr const Type* host_types[] = {
    &TypeOf<signed char>::value,    &TypeOf<unsigned char>::value, &TypeOf<short>::value,
    &TypeOf<unsigned short>::value, &TypeOf<int>::value,           &TypeOf<unsigned>::value,
    &TypeOf<long long>::value,      &TypeOf<float>::value,         &TypeOf<bool>::value};

// {name: (is a register, kind, bits, lanes, type of arrays, elements of the last axis)}
Ref types() {
  Ref all = Ref::checked(PyDict_New());
  const auto add = [&all](const Type& type, bool is_register) {
    const Shape shape = shape_of(type);
    Ref dtype = Ref::checked(reinterpret_cast<PyObject*>(PyArray_DescrFromType(number_of(shape))));
    const Ref row = Ref::checked(Py_BuildValue("OCiiOi", is_register ? Py_True : Py_False, type.kind, type.bits,
                                               type.count, dtype.get(), shape.elements));
    if (PyDict_SetItemString(all.get(), type.name, row.get()) < 0) throw Raised();
  };
  for (const Type* type : register_types) add(*type, true);
  for (const Type* type : host_types) add(*type, false);
  return all;
}

const Type& type_named(const char* name) {
  for (const Type* type : register_types)
    if (std::strcmp(type->name, name) == 0) return *type;
  raise(PyExc_ValueError, "no register type is called '%s'", name);
}

// --- Functions --------------------------------------------------------------------------------------

// call(number of the row, out, operands ...)
PyObject* call_row(PyObject*, PyObject* const* arguments, Py_ssize_t count) {
  return guarded([=] {
    const long number = count < 2 ? -1 : PyLong_AsLong(arguments[0]);
    if (number < 0 || number >= row_count) raise(PyExc_SystemError, "call: no such intrinsic");
    return call(rows[number], arguments[1], arguments + 2, count - 2);
  });
}

// text(type, values of one register, kind of form, bits of fraction)
PyObject* text(PyObject*, PyObject* arguments) {
  return guarded([=]() -> PyObject* {
    const char* name;
    PyObject* values;
    int kind, fraction_bits;
    if (!PyArg_ParseTuple(arguments, "sOii", &name, &values, &kind, &fraction_bits)) throw Raised();
    const Type& type = type_named(name);
    Operand operand;
    read_operand(operand, {"text", nullptr, nullptr, false, {}}, {"values", Role::input, 0, 0}, type, values);
    alignas(64) char image[256];
    if (operand.axes != 0 || !to_images(type, operand.data, 0, 1, image))
      raise(PyExc_ValueError, "text: not the values of one %s", name);
    const bool is_word = kastarri::print_detail::is_word(name);
    const kastarri::print_detail::Register shown = {
        reinterpret_cast<unsigned char*>(image), type.bytes, type.kind, type.bits, type.count, is_word};
    const kastarri::Form form = {static_cast<kastarri::Form::Kind>(kind), fraction_bits};
    return PyUnicode_FromString(kastarri::print_detail::text_of(shown, form).c_str());
  });
}

PyObject* set_coerce(PyObject*, PyObject* function) {
  Ref before(coerce);
  coerce = Ref::to(function).release();
  Py_RETURN_NONE;
}

template <class F>
PyCFunction method(F* function) {
  return reinterpret_cast<PyCFunction>(reinterpret_cast<void (*)()>(function));
}

PyMethodDef methods[] = {
    {"call", method(call_row), METH_FASTCALL, "call(number, out, operands...): calls an intrinsic."},
    {"text", text, METH_VARARGS, "text(type, values, kind, fraction_bits): a register as the printers show it."},
    {"set_coerce", set_coerce, METH_O, "set_coerce(function): makes arrays of operands that are none."},
    {"set_handler", set_handler, METH_VARARGS, "set_handler(name, function): a handler of a port."},
    {nullptr, nullptr, 0, nullptr}};

PyModuleDef definition = {
    PyModuleDef_HEAD_INIT, "_core", "The compiled part of kastarri.", -1, methods, nullptr, nullptr, nullptr, nullptr};

template <class T>
Ref words(T& state) {
  return Ref::checked(PyMemoryView_FromMemory(reinterpret_cast<char*>(&state), sizeof state, PyBUF_WRITE));
}

void add(const Ref& module, const char* name, Ref value) {
  if (PyModule_AddObject(module.get(), name, value.get()) < 0) throw Raised();
  value.release();
}

}  // namespace

}  // namespace kastarri_python

PyMODINIT_FUNC PyInit__core() {
  using namespace kastarri_python;
  import_array();
  return guarded([] {
    Ref module = Ref::checked(PyModule_Create(&definition));
    auto& processor = cstub_Km_ZNB_Orbis_R5_64k_proc;
    add(module, "types", types());
    add(module, "states", words(processor.states));
    add(module, "prid", words(processor.PRID));
    add(module, "version", Ref::checked(PyUnicode_FromString(KASTARRI_VERSION)));
    open_ports();
    return module.release();
  });
}
