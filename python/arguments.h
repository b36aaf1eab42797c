// Arguments of the module's functions, checked with their names in what is raised.
#ifndef PYTHON_ARGUMENTS_H
#define PYTHON_ARGUMENTS_H

#include <pybind11/pybind11.h>

#include <string>
#include <string_view>

#include "morwick/records.h"

namespace python {

namespace py = pybind11;

// A str, as UTF-8; what cannot be said in it is escaped, so that no name is equal to it.
std::string AsString(py::handle object, const char *name);

// "kvr", "ftl" or "msp".
MorwickStream AsStream(py::handle stream);

// An object's bytes, copied where they may change. More than `most` are refused before that.
py::bytes AsBytes(py::handle object, const char *name, size_t most);

// The bytes that an object shows, for as long as this lives: meanwhile it cannot be resized. What
// holds pointers, such as an array of objects, is refused.
class Buffer {
 public:
  // `flags` are those of Python that say how the bytes may lie.
  Buffer(py::handle object, const char *name, int flags = PyBUF_ND);

  size_t size() const { return static_cast<size_t>(view_.len); }
  // Only where they lie one after the other.
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

// Text that came from outside; what is not UTF-8 is kept as file names keep it.
py::str AsText(std::string_view text);

}  // namespace python

#endif
