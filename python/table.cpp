// Many dumps as columns.

#include <pybind11/numpy.h>
#include <pybind11/stl.h>

#include <cstring>
#include <memory>
#include <new>

#include "fleet/table.h"
#include "python/arguments.h"
#include "python/bindings.h"

namespace python {
namespace {

using std::chrono::milliseconds;
using Batches = std::vector<std::unique_ptr<fleet::Batch>>;

void AppendRow(const fleet::Row &row, std::string *rows) {
  rows->append(reinterpret_cast<const char *>(row.values.data()), row.values.size_bytes());
  rows->append(reinterpret_cast<const char *>(row.present.data()), row.present.size());
}

// Reads all dumps. Takes the interpreter's lock, for signals and `progress`, at most ten times a
// second, because other threads of Python may hold it for long.
Batches ReadAll(const fleet::TableOptions &options, const std::vector<std::string> &files,
                const py::object &progress) {
  using Got = fleet::Table::Got;
  const py::gil_scoped_release release;
  fleet::Table table(options, fleet::FileList(files));
  Batches batches;
  uint64_t dumps = 0;
  uint64_t faults = 0;
  auto nextReport = std::chrono::steady_clock::now();
  for (Got got = Got::kBatch; got != Got::kEnd;) {
    std::unique_ptr<fleet::Batch> batch;
    got = table.Next(&batch, milliseconds(50));
    if (got == Got::kBatch) {
      if (batch->outOfMemory) throw std::bad_alloc();
      dumps += batch->files.size();
      for (const fleet::ListedFile &file : batch->files) faults += file.fault.empty() ? 0 : 1;
      batches.push_back(std::move(batch));
    }
    if (got != Got::kEnd && std::chrono::steady_clock::now() < nextReport) continue;
    nextReport = std::chrono::steady_clock::now() + milliseconds(100);
    const py::gil_scoped_acquire acquire;
    if (PyErr_CheckSignals() != 0) throw py::error_already_set();
    if (!progress.is_none()) progress(dumps, faults);
  }
  if (table.outOfMemory()) throw std::bad_alloc();
  return batches;
}

// Copies rows into columns, batch by batch and column by column, so that each value is written
// beside the one before.
void Spread(Batches batches, size_t width, size_t count, uint64_t *values, bool *missing) {
  const py::gil_scoped_release release;
  const size_t rowSize = width * (sizeof(uint64_t) + 1);
  size_t firstRow = 0;
  for (auto &batch : batches) {
    const size_t rows = batch->files.size();
    for (size_t column = 0; column < width; ++column) {
      for (size_t row = 0; row < rows; ++row) {
        const char *cells = batch->rows.data() + row * rowSize;
        const size_t place = column * count + firstRow + row;
        std::memcpy(&values[place], cells + column * sizeof(uint64_t), sizeof(uint64_t));
        missing[place] = cells[width * sizeof(uint64_t) + column] == 0;
      }
    }
    firstRow += rows;
    batch.reset();
  }
}

// The files, their faults, the names of the columns, the values of each column, and where they are
// missing.
py::tuple Table(const std::vector<std::string> &files, py::handle streamName,
                const std::vector<std::string> &names, uint64_t jobs, const py::object &progress) {
  const MorwickStream stream = AsStream(streamName);
  const auto selection = std::make_shared<const fleet::Selection>(std::span(&stream, 1), names);
  const fleet::TableOptions options = {stream, selection, jobs, AppendRow};
  Batches batches = ReadAll(options, files, progress);
  py::list columns;
  for (const auto &column : selection->columns()) columns.append(AsText(column.name));
  const size_t width = columns.size();
  py::list listed;
  py::list faults;
  for (const auto &batch : batches) {
    for (const fleet::ListedFile &file : batch->files) {
      listed.append(AsText(file.name));
      faults.append(file.fault.empty() ? py::object(py::none()) : AsText(file.fault));
    }
  }
  const size_t count = listed.size();
  py::array_t<uint64_t> values({width, count});
  py::array_t<bool> missing({width, count});
  Spread(std::move(batches), width, count, values.mutable_data(), missing.mutable_data());
  return py::make_tuple(listed, faults, columns, values, missing);
}

}  // namespace

void BindTable(py::module_ &module) { module.def("table", &Table); }

}  // namespace python
