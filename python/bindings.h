// What each file of the module adds to it.
#ifndef PYTHON_BINDINGS_H
#define PYTHON_BINDINGS_H

#include <pybind11/pybind11.h>

namespace python {

// Each is called once, when the module is loaded. Then it also makes what lives as long as the
// process: there are no threads yet that could wait for each other's lock.
void BindStatistics(pybind11::module_ &module);
void BindSnapshots(pybind11::module_ &module);
void BindControllers(pybind11::module_ &module);
void BindTable(pybind11::module_ &module);

}  // namespace python

#endif
