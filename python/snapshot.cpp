// Snapshots as NumPy records, and as the library's text.

#include <pybind11/numpy.h>

#include <algorithm>
#include <new>
#include <string>

#include "fleet/snapshot_header.h"
#include "fleet/snapshot_text.h"
#include "morwick/snapshot.h"
#include "morwick/snapshot_fields.h"
#include "python/arguments.h"
#include "python/bindings.h"

namespace python {
namespace {

// The layout that a header describes, or the fixed one for None.
struct Layout {
  explicit Layout(py::handle object) : isFixed(object.is_none()) {
    if (isFixed) return;
    header = ViewOf(AsBytes(object, "header", fleet::kLargestHeader));
    const std::string wrong = fleet::CheckSnapshotHeader(header);
    if (!wrong.empty()) throw py::value_error("header: " + wrong);
    const SnapshotHeader numbers = fleet::LoadSnapshotHeader(header);
    recordSize = numbers.recordSize;
    recordCount = std::max(numbers.recordCount, 1U) - 1;  // the last is not printed
  }

  // The bytes of the whole records, of which there are at most recordCount.
  std::string_view RecordsOf(std::string_view data) const {
    return data.substr(0, std::min<uint64_t>(data.size() / recordSize, recordCount) * recordSize);
  }

  bool isFixed;
  std::string header;
  uint64_t recordSize = sizeof(SnapshotRecord);
  uint64_t recordCount = UINT64_MAX;
};

// NumPy's types of the fixed layout. The names are those of SnapshotRecord, because the public
// fields have only labels. Made once, and never freed: NumPy ends the process when newbyteorder is
// refused memory, and objects of the interpreter must not be given back after its end.
struct FixedTypes {
  static const FixedTypes &Get() {
    static const FixedTypes *const types = new FixedTypes;
    return *types;
  }

  py::object operations;
  py::object record;

 private:
  FixedTypes() {
    PYBIND11_NUMPY_DTYPE(SnapshotOperations, count, totalLatency, maxLatency);
    PYBIND11_NUMPY_DTYPE(SnapshotRecord, timestamp, preemptPercent, writes, reads, erasedBands,
                         hostReads, hostWrites, nandReads, nandWrites, collectedSectors,
                         wearLevelBands, intermediatePendingErase, userPendingErase, hysteresisTime,
                         qosDelaysExtreme, qosDelaysNormal, freeSegments, oldestCommandAge,
                         qosInterval, freeNodes, bufferFragments, bufferHighWater,
                         expeditesSucceeded, expeditesFailed, hostUnmaps, commandTagsMin,
                         commandTagsMax);
    operations = py::dtype::of<SnapshotOperations>().attr("newbyteorder")("<");
    record = py::dtype::of<SnapshotRecord>().attr("newbyteorder")("<");
  }
};

py::dtype MakeType(const py::list &names, const py::list &types, const py::list &offsets,
                   uint64_t size) {
  py::dtype type(names, types, offsets, static_cast<py::ssize_t>(size));
  // Where NumPy is refused memory while it looks for the offsets or the size, it makes up its own.
  const py::object fields = type.attr("fields");
  for (size_t i = 0; i < names.size(); ++i) {
    const py::object offset = fields[names[i]][py::int_(1)];
    if (!offset.equal(offsets[i])) throw std::bad_alloc();
  }
  if (static_cast<uint64_t>(type.itemsize()) != size) throw std::bad_alloc();
  return type;
}

// A type of records for a caller, who may give the fields other names.
py::dtype CopyOf(const py::object &type) {
  const py::list names(type.attr("names"));
  py::list types;
  py::list offsets;
  for (const py::handle name : names) {
    const py::tuple field = type.attr("fields")[name];
    const py::object array = field[0].attr("subdtype");
    if (array.is_none()) {
      types.append(field[0]);
    } else {
      const py::tuple parts = array;
      types.append(py::make_tuple(CopyOf(parts[0]), parts[1]));
    }
    offsets.append(field[1]);
  }
  return MakeType(names, types, offsets, type.attr("itemsize").cast<uint64_t>());
}

// NumPy's type of the records that a header describes. The priorities of a field are a sub-array,
// which is named by the label of their counts.
py::object DescribedType(const Layout &layout) {
  const py::object number = py::dtype("<u4");
  const py::object operations = CopyOf(FixedTypes::Get().operations);
  py::list names;
  py::list types;
  py::list offsets;
  const std::string wrong = fleet::CheckFieldCount(layout.header.data());
  if (!wrong.empty()) throw py::value_error("header: " + wrong);
  MorwickSnapshotField field;
  for (uint32_t i = 0; MorwickSnapshotFieldAt(layout.header.data(), i, &field) != 0; ++i) {
    if (field.kind == kMorwickFieldWithoutNumber) continue;
    names.append(AsText(field.names[0].label));
    offsets.append(field.offset);
    if (field.kind == kMorwickFieldPriorities) {
      types.append(py::make_tuple(operations, py::make_tuple(field.priorities)));
    } else {
      types.append(number);
    }
  }
  return MakeType(names, types, offsets, layout.recordSize);
}

// An array of the records over the buffer itself.
py::object Snapshot(const py::object &data, py::handle header) {
  const Layout layout(header);
  const size_t count = layout.RecordsOf(Buffer(data, "data").bytes()).size() / layout.recordSize;
  const py::object type = layout.isFixed ? CopyOf(FixedTypes::Get().record) : DescribedType(layout);
  return py::module_::import("numpy").attr("frombuffer")(data, type, count);
}

py::str Render(py::handle data, py::handle header) {
  const Layout layout(header);
  const Buffer buffer(data, "data");
  std::string text;
  const fleet::TakeText take = [&](std::string_view more) {
    text += more;
    return true;
  };
  {
    const py::gil_scoped_release release;
    const std::string_view records = layout.RecordsOf(buffer.bytes());
    if (layout.isFixed) {
      fleet::FixedText fixed(take);
      fixed.Begin();
      fixed.Print(records);
      fixed.End();
    } else {
      fleet::DescribedText(take, layout.header).Print(records, [](uint32_t) {});
    }
  }
  return AsText(text);
}

}  // namespace

void BindSnapshots(py::module_ &module) {
  FixedTypes::Get();
  module.def("snapshot", &Snapshot);
  module.def("render", &Render);
}

}  // namespace python
