// Arguments of the module's functions.

#include "python/arguments.h"

#include <pybind11/numpy.h>

#include <algorithm>
#include <string>

#include "fleet/dump.h"
#include "fleet/streams.h"

namespace python {
namespace {

std::string TypeOf(py::handle object) { return Py_TYPE(object.ptr())->tp_name; }

// Whether a format of Python's module struct is that of numbers or bytes, or records of them. The
// names of a record's fields stand between colons.
bool IsPlain(std::string_view format) {
  constexpr std::string_view kPlain = "?cbBhHiIlLqQnNefdgspxT{}:()0123456789, @=<>!^";
  bool isName = false;
  return std::all_of(format.begin(), format.end(), [&](char c) {
    if (c == ':') isName = !isName;
    return isName || kPlain.find(c) != std::string_view::npos;
  });
}

// Whether they are NumPy's records without pointers. NumPy has no format for records whose fields
// overlap or are not in order, and a header may describe such records.
bool IsPlainRecords(py::handle object) {
  if (!py::isinstance<py::array>(object)) return false;
  const py::dtype type = py::reinterpret_borrow<py::array>(object).dtype();
  return type.kind() == 'V' && !type.attr("hasobject").cast<bool>();
}

}  // namespace

std::string AsString(py::handle object, const char *name) {
  if (!py::isinstance<py::str>(object)) {
    throw py::type_error(std::string(name) + " must be a str, not " + TypeOf(object));
  }
  const auto text = py::reinterpret_steal<py::bytes>(
      PyUnicode_AsEncodedString(object.ptr(), "utf-8", "backslashreplace"));
  if (!text) throw py::error_already_set();
  std::string escaped(ViewOf(text));
  // A message would end at a null byte.
  for (size_t at = 0; (at = escaped.find('\0')) != std::string::npos;) {
    escaped.replace(at, 1, "\\x00");
  }
  return escaped;
}

MorwickStream AsStream(py::handle stream) {
  const std::string text = AsString(stream, "stream");
  const auto found = fleet::StreamNamed(text);
  if (!found) throw py::value_error("stream must be 'kvr', 'ftl' or 'msp', not '" + text + "'");
  return *found;
}

py::bytes AsBytes(py::handle object, const char *name, size_t most) {
  Buffer buffer(object, name, PyBUF_INDIRECT);
  if (buffer.size() > most) {
    throw py::value_error(std::string(name) + " is " + fleet::TooLarge(most));
  }
  if (PyBytes_CheckExact(object.ptr())) return py::reinterpret_borrow<py::bytes>(object);
  return buffer.Copy();
}

Buffer::Buffer(py::handle object, const char *name, int flags) {
  const std::string argument = name;
  if (PyObject_CheckBuffer(object.ptr()) == 0) {
    throw py::type_error(argument + " must be an object with a buffer, not " + TypeOf(object));
  }
  if (!IsPlainRecords(object)) flags |= PyBUF_FORMAT;
  if (PyObject_GetBuffer(object.ptr(), &view_, flags) != 0) {
    if (PyErr_ExceptionMatches(PyExc_MemoryError) != 0) throw py::error_already_set();
    py::error_already_set cause;  // such as a view that was released
    const std::string why = argument + ": " + std::string(py::str(cause.value()));
    py::raise_from(cause, PyExc_BufferError, why.c_str());
    throw py::error_already_set();
  }
  if (view_.format == nullptr || IsPlain(view_.format)) return;
  throw py::type_error(argument + " must hold numbers or bytes, not items of the format " +
                       view_.format);
}

py::bytes Buffer::Copy() {
  auto copy = py::reinterpret_steal<py::bytes>(PyBytes_FromStringAndSize(nullptr, view_.len));
  if (!copy || PyBuffer_ToContiguous(PyBytes_AS_STRING(copy.ptr()), &view_, view_.len, 'C') != 0) {
    throw py::error_already_set();
  }
  return copy;
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
