// Many dumps as columns.
#ifndef PYTHON_TABLE_H
#define PYTHON_TABLE_H

#include <string>
#include <vector>

#include "python/arguments.h"

namespace python {

// The files, their faults, the names of the columns, the values of each column, and where they are
// missing.
py::tuple Table(const std::vector<std::string> &files, py::handle stream,
                const std::vector<std::string> &names, uint64_t jobs, const py::object &progress);

}  // namespace python

#endif
