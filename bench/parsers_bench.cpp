// The statistics parsers, release included, in ns per entry, beside two baselines on the same
// stream: the plain version, which makes each text with one snprintf, and the bare heap work.

#include <benchmark/benchmark.h>
#include <malloc.h>

#include <cstdio>
#include <cstdlib>

#include "bench/streams.h"
#include "morwick/morwick.h"
#include "stats/entry_list.h"
#include "stats/key_table.h"

namespace {

using bench::Stream;

// The plain version makes the same walk and lists. A text has at most 98 characters, and a NUL.
template <typename Context>
void PlainAdd(Context *context, const char *prefix, const char *name, uint64_t value) {
  auto *valueNode = static_cast<ContextNode *>(std::calloc(1, sizeof(ContextNode)));
  auto *nameNode = static_cast<ContextNode *>(std::calloc(1, sizeof(ContextNode)));
  if (valueNode == nullptr || nameNode == nullptr) std::abort();
  if (context->namesTail != nullptr) {
    context->namesTail->next = nameNode;
    context->valuesTail->next = valueNode;
  } else {
    context->namesHead = nameNode;
    context->valuesHead = valueNode;
  }
  context->namesTail = nameNode;
  context->valuesTail = valueNode;
  std::snprintf(nameNode->text, 99, "%s%s", prefix, name);
  std::snprintf(valueNode->text, 99, "%llu", static_cast<unsigned long long>(value));
  valueNode->value = value;
}

template <typename Element, typename Context>
void PlainAddAll(Context *context, const char *name, const char *separator, const char *bytes,
                 uint32_t count) {
  char prefix[100];
  std::snprintf(prefix, sizeof prefix, "%s%s", name, separator);
  for (uint32_t i = 0; i < count; ++i) {
    Element element;
    std::memcpy(&element, bytes + i * sizeof element, sizeof element);
    char index[100] = "";
    if (count > 1) std::snprintf(index, sizeof index, "%d", static_cast<int>(i));
    PlainAdd(context, count > 1 ? prefix : name, index, element);
  }
}

// The length in the header counts units of kUnit bytes.
template <typename Word, size_t kUnit, typename Element, typename Context>
void PlainParse(Context *context, const Stream &stream, const auto &keys, const char *separator) {
  const char *position = stream.buffer.data();
  const char *end = position + stream.buffer.size();
  while (position < end) {
    Word header[2];
    std::memcpy(header, position, sizeof header);
    position += sizeof header;
    const MorwickKey *key = keys.Find(header[0]);
    PlainAddAll<Element>(context, key->name, separator, position, key->valueCount);
    position += header[1] * kUnit;
  }
}

// Allocates the two nodes of each entry, fills them with zeros, and frees them, in the parsers'
// order.
void BareHeap(size_t entries) {
  static std::vector<ContextNode *> nodes;
  nodes.resize(entries * 2);
  for (ContextNode *&node : nodes) {
    node = static_cast<ContextNode *>(std::malloc(sizeof(ContextNode)));
    if (node == nullptr) std::abort();
    *node = morwick::kEmptyNode;
    benchmark::DoNotOptimize(node);
  }
  for (ContextNode *node : nodes) std::free(node);
}

template <typename Parse>
void Measure(benchmark::State &state, const Stream &stream, Parse parse) {
  malloc_trim(0);  // gives back freed memory, so that every benchmark starts alike
  for (auto _ : state) parse(stream);
  state.counters["ns/entry"] = benchmark::Counter(
      static_cast<double>(stream.entries) * 1e-9,
      benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}

uint32_t Size(const Stream &stream) { return static_cast<uint32_t>(stream.buffer.size()); }

void KVR(const Stream &stream) {
  KVRStatsCxt context = {};
  if (KVRParseBufferToCxt(&context, stream.buffer.data(), Size(stream)) != 1) std::abort();
  KVRReleaseContext(&context);
}

void PlainKVR(const Stream &stream) {
  KVRStatsCxt context = {};
  PlainParse<uint32_t, 8, uint64_t>(&context, stream, morwick::kStatsKeys, "");
  KVRReleaseContext(&context);
}

template <auto *kParse>
void Generic(const Stream &stream) {
  GenericParserCxt context = {};
  if (kParse(&context, stream.buffer.data(), Size(stream)) != stream.entries) std::abort();
  ReleaseGenericParserCxt(&context);
}

void PlainFTL(const Stream &stream) {
  GenericParserCxt context = {};
  PlainParse<uint32_t, 8, uint64_t>(&context, stream, morwick::kStatsKeys, "_");
  ReleaseGenericParserCxt(&context);
}

void PlainMSP(const Stream &stream) {
  GenericParserCxt context = {};
  PlainParse<uint16_t, 1, uint32_t>(&context, stream, morwick::kMSPKeys, "");
  ReleaseGenericParserCxt(&context);
}

void Heap(const Stream &stream) { BareHeap(stream.entries); }

// The work of a tool that wants values without lists: every value goes to its column. The columns,
// one for each value of each key, are looked up once, by their names.
template <MorwickStream kKind, typename Value>
class Columns {
 public:
  Columns() {
    for (uint32_t i = 0; i < MorwickKeyCount(kKind); ++i) {
      const MorwickKey *key = MorwickFindKey(kKind, MorwickKeyAt(kKind, i)->name);
      if (key->id >= firstOfId_.size()) firstOfId_.resize(key->id + 1);
      firstOfId_[key->id] = static_cast<uint32_t>(values_.size());
      values_.resize(values_.size() + key->valueCount);
    }
  }

  void Fill(const Stream &stream) {
    static_assert(std::endian::native == std::endian::little);
    uint64_t *values = values_.data();
    const uint32_t *first = firstOfId_.data();
    MorwickRecordReader reader;
    MorwickRecord record;
    MorwickStartRecords(&reader, kKind, stream.buffer.data(), stream.buffer.size());
    while (MorwickNextRecord(&reader, &record) != 0) {
      const auto *bytes = static_cast<const char *>(record.values);
      uint64_t *column = values + first[record.id];
      for (uint32_t i = 0; i < record.valueCount; ++i) {
        Value value;
        std::memcpy(&value, bytes + i * sizeof value, sizeof value);
        column[i] = value;
      }
    }
    benchmark::DoNotOptimize(values_.data());
    benchmark::ClobberMemory();
  }

 private:
  std::vector<uint32_t> firstOfId_;
  std::vector<uint64_t> values_;
};

template <MorwickStream kKind, typename Value>
void Walk(const Stream &stream) {
  static Columns<kKind, Value> columns;
  columns.Fill(stream);
}

const bool kRegistered = [] {
  static std::vector<Stream> streams;
  streams.reserve(6);
  for (const int copies : {1, 32}) {
    const std::string suffix = "/x" + std::to_string(copies);
    const auto add = [&](const char *name, const Stream &stream, void (*run)(const Stream &)) {
      benchmark::RegisterBenchmark(
          (name + suffix).c_str(),
          [&stream, run](benchmark::State &state) { Measure(state, stream, run); });
    };
    const Stream &stats = streams.emplace_back(bench::StatsStream(copies));
    const Stream &msp = streams.emplace_back(bench::MSPStream(copies * 10));
    add("KVR/parser", stats, KVR);
    add("KVR/walk", stats, Walk<kMorwickKVR, uint64_t>);
    add("KVR/plain", stats, PlainKVR);
    add("KVR/heap", stats, Heap);
    add("FTL/parser", stats, Generic<KVRFTLParseBufferToCxt>);
    add("FTL/walk", stats, Walk<kMorwickFTL, uint64_t>);
    add("FTL/plain", stats, PlainFTL);
    add("FTL/heap", stats, Heap);
    add("MSP/parser", msp, Generic<KVRMSPParseBufferToCxt>);
    add("MSP/walk", msp, Walk<kMorwickMSP, uint32_t>);
    add("MSP/plain", msp, PlainMSP);
    add("MSP/heap", msp, Heap);
  }
  return true;
}();

}  // namespace

int main(int argc, char **argv) {
  // Keeps freed memory in the process: otherwise all three mostly measure the kernel's page faults.
  mallopt(M_TRIM_THRESHOLD, 1 << 30);
  benchmark::Initialize(&argc, argv);
  benchmark::RunSpecifiedBenchmarks();
}
