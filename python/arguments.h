// Checks the arguments of the module's functions; the errors raised name the argument.
#ifndef PYTHON_ARGUMENTS_H
#define PYTHON_ARGUMENTS_H

#include <pybind11/pybind11.h>

#include <string>
#include <string_view>

#include "morwick/records.h"

namespace python {

namespace py = pybind11;

// A str as UTF-8. Null bytes and characters that UTF-8 cannot hold are escaped, so that the text is
// no known name.
std::string AsString(py::handle object, const char *name);

// "kvr", "ftl" or "msp".
MorwickStream AsStream(py::handle stream);

// An object's bytes, copied unless it is of Python's type bytes. More than `most` are refused.
py::bytes AsBytes(py::handle object, const char *name, size_t most);

// A view of an object's bytes. While it lives the object cannot be resized. Items that are or hold
// pointers, such as Python objects, are refused.
class Buffer {
 public:
  // `flags` are those of PyObject_GetBuffer, which say how the bytes may lie.
  Buffer(py::handle object, const char *name, int flags = PyBUF_ND);

  size_t size() const { return static_cast<size_t>(view_.len); }
  // Only for contiguous bytes, which PyBUF_ND asks for.
  std::string_view bytes() const { return {static_cast<const char *>(view_.buf), size()}; }
  py::bytes Copy();

 private:
  struct View : Py_buffer {
    View() : Py_buffer() {}
    ~View() { PyBuffer_Release(this); }
    View(const View &) = delete;
    View &operator=(const View &) = delete;
  };
  View view_;
};

std::string_view ViewOf(const py::bytes &bytes);

// Text that came from outside. Bytes that are not UTF-8 become surrogates, as in file names.
py::str AsText(std::string_view text);

}  // namespace python

#endif
