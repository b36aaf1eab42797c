// The functions by which each file of the module adds its part.
#ifndef PYTHON_BINDINGS_H
#define PYTHON_BINDINGS_H

#include <pybind11/pybind11.h>

namespace python {

// Each is called once, when the module is loaded. Objects that live as long as the process are made
// there, because no threads can wait for each other's lock yet.
void BindStatistics(pybind11::module_ &module);
void BindSnapshots(pybind11::module_ &module);
void BindControllers(pybind11::module_ &module);
void BindTable(pybind11::module_ &module);

}  // namespace python

#endif
