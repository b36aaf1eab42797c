// The module _native, on which the package `morwick` is built.

#include <exception>
#include <stdexcept>
#include <utility>

#include "morwick/morwick.h"
#include "python/bindings.h"

namespace {

// pybind11 throws a runtime_error when Python made no object. Where the reason is a MemoryError,
// that is what the caller gets.
void KeepMemoryError(std::exception_ptr error) {
  try {
    std::rethrow_exception(std::move(error));
  } catch (const std::runtime_error &) {
    if (PyErr_Occurred() == nullptr || PyErr_ExceptionMatches(PyExc_MemoryError) == 0) throw;
  }
}

}  // namespace

PYBIND11_MODULE(_native, module) {
  pybind11::register_local_exception_translator(KeepMemoryError);
  module.attr("version") = MORWICK_VERSION_TEXT;
  module.attr("platform") = MORWICK_PLATFORM_NAME;
  python::BindStatistics(module);
  python::BindSnapshots(module);
  python::BindControllers(module);
  python::BindTable(module);
}
