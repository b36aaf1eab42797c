// Snapshots as NumPy records, and as the library's text.
#ifndef PYTHON_SNAPSHOT_H
#define PYTHON_SNAPSHOT_H

#include "python/arguments.h"

namespace python {

// Before the others, when the module is loaded.
void PrepareLayouts();

// The records of a snapshot in the layout of a header, or the fixed one with None, over the buffer
// itself.
py::object Snapshot(const py::object &data, py::handle header);

py::str Render(py::handle data, py::handle header);

}  // namespace python

#endif
