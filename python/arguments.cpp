// Arguments of the module's functions.

#include "python/arguments.h"

#include <string>

#include "fleet/streams.h"

namespace python {
namespace {

std::string TypeOf(py::handle object) { return Py_TYPE(object.ptr())->tp_name; }

void RequireBuffer(py::handle object, const char *name) {
  if (PyObject_CheckBuffer(object.ptr()) != 0) return;
  throw py::type_error(std::string(name) + " must be an object with a buffer, not " +
                       TypeOf(object));
}

}  // namespace

std::string AsString(py::handle object, const char *name) {
  if (!py::isinstance<py::str>(object)) {
    throw py::type_error(std::string(name) + " must be a str, not " + TypeOf(object));
  }
  Py_ssize_t size = 0;
  const char *text = PyUnicode_AsUTF8AndSize(object.ptr(), &size);
  if (text == nullptr) throw py::error_already_set();
  return {text, static_cast<size_t>(size)};
}

MorwickStream AsStream(py::handle stream) {
  const std::string text = AsString(stream, "stream");
  const auto found = fleet::StreamNamed(text);
  if (!found) throw py::value_error("stream must be 'kvr', 'ftl' or 'msp', not '" + text + "'");
  return *found;
}

py::bytes AsBytes(py::handle object, const char *name) {
  if (PyBytes_CheckExact(object.ptr())) return py::reinterpret_borrow<py::bytes>(object);
  RequireBuffer(object, name);
  auto copy = py::reinterpret_steal<py::bytes>(PyBytes_FromObject(object.ptr()));
  if (!copy) throw py::error_already_set();
  return copy;
}

Buffer::Buffer(py::handle object, const char *name) {
  RequireBuffer(object, name);
  if (PyObject_GetBuffer(object.ptr(), &view_, PyBUF_SIMPLE) == 0) return;
  if (PyErr_ExceptionMatches(PyExc_MemoryError) != 0) throw py::error_already_set();
  // The cause stays attached, such as a view that was released.
  py::raise_from(PyExc_BufferError, (std::string(name) + " gives no contiguous buffer").c_str());
  throw py::error_already_set();
}

std::string_view ViewOf(const py::bytes &bytes) {
  return {PyBytes_AS_STRING(bytes.ptr()), static_cast<size_t>(PyBytes_GET_SIZE(bytes.ptr()))};
}

py::str AsText(std::string_view text) {
  auto decoded = py::reinterpret_steal<py::str>(
      PyUnicode_DecodeUTF8(text.data(), static_cast<Py_ssize_t>(text.size()), "surrogateescape"));
  if (!decoded) throw py::error_already_set();
  return decoded;
}

}  // namespace python
