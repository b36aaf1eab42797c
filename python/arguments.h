// Arguments of the module's functions, checked with their names in what is raised.
#ifndef PYTHON_ARGUMENTS_H
#define PYTHON_ARGUMENTS_H

#include <pybind11/pybind11.h>

#include <string>
#include <string_view>

#include "morwick/records.h"

namespace python {

namespace py = pybind11;

// A str, as UTF-8.
std::string AsString(py::handle object, const char *name);

// "kvr", "ftl" or "msp".
MorwickStream AsStream(py::handle stream);

// An object's bytes, copied where they may change.
py::bytes AsBytes(py::handle object, const char *name);

// The bytes that an object shows, for as long as this lives: meanwhile it cannot be resized.
class Buffer {
 public:
  Buffer(py::handle object, const char *name);
  ~Buffer() { PyBuffer_Release(&view_); }
  Buffer(const Buffer &) = delete;
  Buffer &operator=(const Buffer &) = delete;

  std::string_view bytes() const {
    return {static_cast<const char *>(view_.buf), static_cast<size_t>(view_.len)};
  }

 private:
  Py_buffer view_;
};

std::string_view ViewOf(const py::bytes &bytes);

// Text that came from outside; what is not UTF-8 is kept as file names keep it.
py::str AsText(std::string_view text);

}  // namespace python

#endif
