// Dumps of statistics.

#include <pybind11/numpy.h>

#include <array>
#include <cerrno>
#include <memory>
#include <new>
#include <optional>
#include <vector>

#include "fleet/judge.h"
#include "fleet/streams.h"
#include "fleet/summary.h"
#include "morwick/kvr_stats.h"
#include "morwick/little_endian.h"
#include "python/bindings.h"
#include "python/boxed.h"

namespace python {
namespace {

// In bytes. For smaller dumps two threads are slower when they give back the interpreter's lock:
// they wait for it longer than the walk takes.
constexpr size_t kWorthUnlocking = 128 << 10;

py::int_ Number(uint64_t value) {
  auto number = py::reinterpret_steal<py::int_>(PyLong_FromUnsignedLongLong(value));
  if (!number) throw py::error_already_set();
  return number;
}

// The names of a stream's keys as Python objects. Made once, and never freed: objects of the
// interpreter must not be given back after its end.
class KeyNames {
 public:
  static const KeyNames &Of(MorwickStream stream) {
    static const KeyNames *const stats = new KeyNames(kMorwickKVR);  // FTL has the same keys
    static const KeyNames *const msp = new KeyNames(kMorwickMSP);
    return stream == kMorwickMSP ? *msp : *stats;
  }

  // The key's place in names_.
  uint32_t PlaceOf(const MorwickKey &key) const { return key.id - firstId_; }
  size_t placeCount() const { return names_.size(); }
  py::handle NameAt(uint32_t place) const { return names_[place]; }

  // Returns nothing, and raises nothing, when no key has that name.
  std::optional<uint32_t> Find(py::handle name) const {
    PyObject *place = PyDict_GetItemWithError(places_.ptr(), name.ptr());
    if (place != nullptr) return static_cast<uint32_t>(PyLong_AsUnsignedLong(place));
    if (PyErr_Occurred() != nullptr) throw py::error_already_set();
    return std::nullopt;
  }

 private:
  explicit KeyNames(MorwickStream stream) : firstId_(MorwickKeyAt(stream, 0)->id) {
    for (uint32_t i = 0; i < MorwickKeyCount(stream); ++i) {
      const MorwickKey &key = *MorwickKeyAt(stream, i);
      names_.resize(PlaceOf(key) + 1);  // ids ascend
      names_.back() = py::str(key.name);
      places_[names_.back()] = PlaceOf(key);
    }
  }

  uint32_t firstId_;
  std::vector<py::object> names_;  // null for an id without a key
  py::dict places_;                // by name
};

// A dump that was walked once. Its values become Python objects when they are asked for.
class Dump {
 public:
  Dump(py::handle data, py::handle stream)
      : bytes_(AsBytes(data, "data", UINT32_MAX)),
        stream_(AsStream(stream)),
        names_(KeyNames::Of(stream_)),
        found_(names_.placeCount()) {
    std::optional<py::gil_scoped_release> release;
    if (view().size() >= kWorthUnlocking) release.emplace();
    fleet::Judge judge(view());
    order_.reserve(names_.placeCount());
    const MorwickRecord end = fleet::WalkRecords(stream_, view(), [&](const MorwickRecord &record) {
      judge.Take(record);
      if (record.valueCount == 0) return;
      const uint32_t place = names_.PlaceOf(*record.key);
      if (found_[place].count == 0) order_.push_back(place);
      found_[place] = {static_cast<const uint8_t *>(record.values), record.valueCount,
                       record.key->valueCount > 1};
    });
    fault_ = judge.Finish(end).Fault();
    end_ = end.offset;
  }

  // The value in the last record of that name: a number, or an array of them. Raises KeyError.
  py::object Value(py::handle name) const {
    if (const Found *found = Find(name)) return ValueOf(*found);
    PyErr_SetObject(PyExc_KeyError, name.ptr());
    throw py::error_already_set();
  }

  bool Has(py::handle name) const { return Find(name) != nullptr; }
  size_t size() const { return order_.size(); }
  uint64_t end() const { return end_; }
  py::bytes bytes() const { return bytes_; }
  py::object Fault() const { return fault_.empty() ? py::object(py::none()) : AsText(fault_); }

  // All values by name, in the order in which the names first came.
  py::dict Values() const {
    py::dict values;
    for (const uint32_t place : order_) {
      const py::object value = ValueOf(found_[place]);
      if (PyDict_SetItem(values.ptr(), names_.NameAt(place).ptr(), value.ptr()) != 0) {
        throw py::error_already_set();
      }
    }
    return values;
  }

  // Each value that the parser adds, with its name.
  py::list Entries() const {
    py::list entries;
    fleet::WalkRecords(stream_, view(), [&](const MorwickRecord &record) {
      std::array<char, kMorwickNameRoom> name;
      for (uint32_t i = 0; i < record.valueCount; ++i) {
        const uint32_t length =
            MorwickValueName(stream_, record.key, record.valueCount, i, name.data());
        entries.append(
            py::make_tuple(AsText({name.data(), length}), Number(MorwickValue(&record, i))));
      }
    });
    return entries;
  }

  py::dict Summary() const {
    py::dict summary;
    if (stream_ != kMorwickKVR) return summary;
    KVRStatsCxt fields = {};
    const std::unique_ptr<KVRStatsCxt, decltype(&KVRReleaseContext)> owned(&fields,
                                                                           KVRReleaseContext);
    errno = 0;
    KVRParseBufferToCxt(&fields, view().data(), static_cast<uint32_t>(view().size()));
    if (errno == ENOMEM) throw std::bad_alloc();
    const auto isPresent = [&](std::string_view name) { return Has(AsText(name)); };
    for (const fleet::Figure &figure : fleet::Summarise(fields, isPresent)) {
      const py::str name = AsText(figure.name);
      if (figure.ratio) {
        summary[name] = *figure.ratio;
      } else if (figure.values.size() == 1) {
        summary[name] = Number(figure.values[0]);
      } else {
        summary[name] = py::array_t<uint64_t>(static_cast<py::ssize_t>(figure.values.size()),
                                              figure.values.data());
      }
    }
    return summary;
  }

 private:
  // The last record of a key.
  struct Found {
    const uint8_t *values = nullptr;
    uint32_t count = 0;
    bool isArray = false;
  };

  std::string_view view() const { return ViewOf(bytes_); }

  const Found *Find(py::handle name) const {
    const auto place = names_.Find(name);
    return place && found_[*place].count > 0 ? &found_[*place] : nullptr;
  }

  uint64_t Load(const Found &found, uint32_t index) const {
    return stream_ == kMorwickMSP ? LoadLittleEndian32(found.values + size_t{4} * index)
                                  : LoadLittleEndian64(found.values + size_t{8} * index);
  }

  py::object ValueOf(const Found &found) const {
    if (!found.isArray) return Number(Load(found, 0));
    py::array_t<uint64_t> array(found.count);
    uint64_t *values = array.mutable_data();
    for (uint32_t i = 0; i < found.count; ++i) values[i] = Load(found, i);
    return array;
  }

  py::bytes bytes_;
  MorwickStream stream_;
  const KeyNames &names_;
  std::vector<Found> found_;     // by place
  std::vector<uint32_t> order_;  // places, as their keys first came
  std::string fault_;
  uint64_t end_ = 0;
};

// id, name and number of values of each key.
py::list Keys(py::handle streamName) {
  const MorwickStream stream = AsStream(streamName);
  py::list keys;
  for (uint32_t i = 0; i < MorwickKeyCount(stream); ++i) {
    const MorwickKey &key = *MorwickKeyAt(stream, i);
    keys.append(py::make_tuple(key.id, key.name, key.valueCount));
  }
  return keys;
}

}  // namespace

void BindStatistics(py::module_ &module) {
  for (const MorwickStream stream : fleet::kStreams) KeyNames::Of(stream);
  module.def("parse", &MakeBoxed<Dump, py::handle, py::handle>);
  module.def("value",
             [](py::handle dump, py::handle name) { return Unbox<Dump>(dump).Value(name); });
  module.def("has", [](py::handle dump, py::handle name) { return Unbox<Dump>(dump).Has(name); });
  module.def("values", [](py::handle dump) { return Unbox<Dump>(dump).Values(); });
  module.def("entries", [](py::handle dump) { return Unbox<Dump>(dump).Entries(); });
  module.def("summary", [](py::handle dump) { return Unbox<Dump>(dump).Summary(); });
  module.def("size", [](py::handle dump) { return Unbox<Dump>(dump).size(); });
  module.def("fault", [](py::handle dump) { return Unbox<Dump>(dump).Fault(); });
  module.def("end", [](py::handle dump) { return Unbox<Dump>(dump).end(); });
  module.def("data", [](py::handle dump) { return Unbox<Dump>(dump).bytes(); });
  module.def("keys", &Keys);
}

}  // namespace python
