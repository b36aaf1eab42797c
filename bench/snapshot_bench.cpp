// Both snapshot renderings, in ns per line of 2,000 records of mixed magnitudes, beside the plain
// version (one snprintf a piece) and, for the fixed layout, beside libfmt with compiled formats;
// and the ways to write a line of the fixed layout, also for numbers of one length.

#include <benchmark/benchmark.h>
#include <fmt/compile.h>

#include <cstdio>
#include <cstring>
#include <functional>
#include <random>
#include <string>
#include <vector>

#include "morwick/morwick.h"
#include "stats/snapshot_legend.h"
#include "stats/snapshot_lines.h"

namespace {

constexpr uint32_t kRecords = 2000;

// Numbers of up to kBits bits above the smallest one. The last record of the described rendering
// is never printed, so there is one more.
template <unsigned kBits = 32, uint32_t kSmallest = 0>
const std::vector<SnapshotRecord> &Records() {
  static const std::vector<SnapshotRecord> records = [] {
    std::mt19937 random(1);
    std::vector<SnapshotRecord> made(kRecords + 1);
    for (SnapshotRecord &record : made) {
      uint32_t words[sizeof record / 4];
      for (uint32_t &word : words) {
        word = kSmallest + static_cast<uint32_t>(random() >> (32 - kBits) >> random() % kBits);
      }
      words[0] |= 1;  // not empty
      std::memcpy(&record, words, sizeof record);
    }
    return made;
  }();
  return records;
}

// Writes each piece with one bounded snprintf.
class PlainWriter {
 public:
  PlainWriter(char *output, size_t capacity) : output_(output), free_(capacity) {}

  template <typename... Values>
  void Append(const char *format, Values... values) {
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-nonliteral"
#pragma GCC diagnostic ignored "-Wformat-security"
    const auto length = static_cast<size_t>(std::snprintf(output_, free_, format, values...));
#pragma GCC diagnostic pop
    if (length >= free_) std::abort();
    output_ += length;
    free_ -= length;
  }

  char *end() const { return output_; }

 private:
  char *output_;
  size_t free_;
};

// The columns up to the first number of RO, which one snprintf prints.
constexpr char kHead[] =
    "T=%04u E=%02u HR=%4u HW=%4u NR=%4u NW=%4u TH=%8u.%02u GC=%4u W=%2u BI=%3u BU=%3u V=%5u "
    "BF=%2u/%2u P=%2u H=%2u/%2u X=%2u/%2u L=%3u/%3u C=%2u/%2u S=%4u U=%8u RO=%4u";

void PlainPriorities(PlainWriter &writer, const SnapshotOperations *operations,
                     uint32_t SnapshotOperations::*value, const char *first, const char *further) {
  for (int k = 0; k < 4; ++k) writer.Append(k == 0 ? first : further, operations[k].*value);
}

size_t PlainFixed(char *output, size_t capacity) {
  PlainWriter writer(output, capacity);
  writer.Append("%s", morwick::kSnapshotLegend.data());
  for (uint32_t i = 0; i < kRecords; ++i) {
    const SnapshotRecord &r = Records()[i];
    writer.Append(kHead, r.timestamp, r.erasedBands, r.hostReads, r.hostWrites, r.nandReads,
                  r.nandWrites, r.hysteresisTime / 1000, r.hysteresisTime % 1000 / 10,
                  r.collectedSectors, r.wearLevelBands, r.intermediatePendingErase,
                  r.userPendingErase, r.freeNodes, r.bufferFragments, r.bufferHighWater,
                  r.preemptPercent, r.qosDelaysNormal, r.qosDelaysExtreme, r.expeditesSucceeded,
                  r.expeditesFailed, r.oldestCommandAge, r.qosInterval, r.commandTagsMin,
                  r.commandTagsMax, r.freeSegments, r.hostUnmaps, r.reads[0].count);
    for (int k = 1; k < 4; ++k) writer.Append("/%4u", r.reads[k].count);
    using Operations = SnapshotOperations;
    PlainPriorities(writer, r.reads, &Operations::totalLatency, " RL=%7u", "/%7u");
    PlainPriorities(writer, r.reads, &Operations::maxLatency, " RM=%5u", "/%5u");
    PlainPriorities(writer, r.writes, &Operations::count, " WO=%4u", "/%4u");
    PlainPriorities(writer, r.writes, &Operations::totalLatency, " WL=%7u", "/%7u");
    PlainPriorities(writer, r.writes, &Operations::maxLatency, " WM=%5u", "/%5u");
    writer.Append("\n");
  }
  writer.Append("\n");
  return static_cast<size_t>(writer.end() - output);
}

// Prints the columns one by one: one compiled format for all would take six times as long.
size_t FmtFixed(char *output, size_t) {
  char *end = fmt::format_to(output, FMT_COMPILE("{}"), morwick::kSnapshotLegend);
#define PRINT(format, value) end = fmt::format_to(end, FMT_COMPILE(format), value)
#define PRINT_PRIORITIES(label, width, operations, value)       \
  PRINT(" " label "={:" width "}", record.operations[0].value); \
  PRINT("/{:" width "}", record.operations[1].value);           \
  PRINT("/{:" width "}", record.operations[2].value);           \
  PRINT("/{:" width "}", record.operations[3].value)
  for (uint32_t i = 0; i < kRecords; ++i) {
    const SnapshotRecord &record = Records()[i];
    PRINT("T={:04}", record.timestamp);
    PRINT(" E={:02}", record.erasedBands);
    PRINT(" HR={:4}", record.hostReads);
    PRINT(" HW={:4}", record.hostWrites);
    PRINT(" NR={:4}", record.nandReads);
    PRINT(" NW={:4}", record.nandWrites);
    PRINT(" TH={:8}", record.hysteresisTime / 1000);
    PRINT(".{:02}", record.hysteresisTime % 1000 / 10);
    PRINT(" GC={:4}", record.collectedSectors);
    PRINT(" W={:2}", record.wearLevelBands);
    PRINT(" BI={:3}", record.intermediatePendingErase);
    PRINT(" BU={:3}", record.userPendingErase);
    PRINT(" V={:5}", record.freeNodes);
    PRINT(" BF={:2}", record.bufferFragments);
    PRINT("/{:2}", record.bufferHighWater);
    PRINT(" P={:2}", record.preemptPercent);
    PRINT(" H={:2}", record.qosDelaysNormal);
    PRINT("/{:2}", record.qosDelaysExtreme);
    PRINT(" X={:2}", record.expeditesSucceeded);
    PRINT("/{:2}", record.expeditesFailed);
    PRINT(" L={:3}", record.oldestCommandAge);
    PRINT("/{:3}", record.qosInterval);
    PRINT(" C={:2}", record.commandTagsMin);
    PRINT("/{:2}", record.commandTagsMax);
    PRINT(" S={:4}", record.freeSegments);
    PRINT(" U={:8}", record.hostUnmaps);
    PRINT_PRIORITIES("RO", "4", reads, count);
    PRINT_PRIORITIES("RL", "7", reads, totalLatency);
    PRINT_PRIORITIES("RM", "5", reads, maxLatency);
    PRINT_PRIORITIES("WO", "4", writes, count);
    PRINT_PRIORITIES("WL", "7", writes, totalLatency);
    PRINT_PRIORITIES("WM", "5", writes, maxLatency);
    *end++ = '\n';
  }
#undef PRINT_PRIORITIES
#undef PRINT
  *end++ = '\n';
  *end = '\0';
  return static_cast<size_t>(end - output);
}

size_t Fixed(char *output, size_t capacity) {
  uint64_t size = capacity;
  if (KVRParseSnapshotBuffer(Records<>().data(), kRecords * sizeof(SnapshotRecord), output,
                             &size) != 1) {
    std::abort();
  }
  return size;
}

// The header that describes the fixed layout's main columns: 19 descriptors.
struct Header {
  SnapshotHeader head = {0, 6, sizeof(SnapshotRecord), kRecords + 1, {}, 40, {}};
  char text[4] = "T";
  uint32_t count = 19;
  uint32_t unused = 0;
  SnapshotFieldDescriptor fields[19] = {
      {0, 0, 0, 4, "T=%04u"},         {0, 0, 104, 4, " E=%02u"}, {0, 0, 108, 4, " HR=%4u"},
      {0, 0, 112, 4, " HW=%4u"},      {0, 0, 116, 4, " NR=%4u"}, {0, 0, 120, 4, " NW=%4u"},
      {2, 0, 156, 4, " TH=%8u.%02u"}, {0, 0, 124, 4, " GC=%4u"}, {0, 0, 132, 4, " W=%2u"},
      {0, 0, 144, 4, " BI=%3u"},      {0, 0, 148, 4, " BU=%3u"}, {0, 0, 180, 4, " V=%5u"},
      {0, 0, 188, 4, " BF=%2u"},      {0, 0, 192, 4, "/%2u"},    {0, 0, 4, 4, " P=%2u"},
      {0, 0, 168, 4, " S=%4u"},       {0, 0, 208, 4, " U=%8u"},  {3, 0, 56, 48, " R%s="},
      {3, 0, 8, 48, " W%s="},
  };
};

size_t PlainDescribed(char *output, size_t capacity) {
  static const Header header;
  PlainWriter writer(output, capacity);
  writer.Append("- KVR Snapshot - \n%s\n", header.text);
  for (uint32_t i = 0; i < kRecords; ++i) {
    const auto *record = reinterpret_cast<const char *>(&Records()[i]);
    const auto word = [&](uint32_t offset) {
      uint32_t value;
      std::memcpy(&value, record + offset, sizeof value);
      return value;
    };
    for (const SnapshotFieldDescriptor &field : header.fields) {
      if (field.kind == 0) {
        writer.Append(field.format, word(field.fieldOffset));
      } else if (field.kind == 2) {
        const uint32_t value = word(field.fieldOffset);
        writer.Append(field.format, value / 1000, value % 1000 / 10);
      } else {
        const char *labels[] = {"O", "L", "M"};
        const char *first[] = {"%4u", "%7u", "%5u"};
        const char *further[] = {"/%4u", "/%7u", "/%5u"};
        for (uint32_t part = 0; part < 3; ++part) {
          writer.Append(field.format, labels[part]);
          for (uint32_t k = 0; k < field.fieldSize / 12; ++k) {
            writer.Append(k == 0 ? first[part] : further[part],
                          word(field.fieldOffset + 4 * part + 12 * k));
          }
        }
      }
    }
    writer.Append("\n");
  }
  return static_cast<size_t>(writer.end() - output);
}

size_t Described(char *output, size_t capacity) {
  static const Header header;
  uint64_t size = capacity;
  uint32_t state = 0;
  if (KVRParseSnapshotBufferWithInplaceParser(Records<>().data(),
                                              sizeof(SnapshotRecord) * Records().size(), output,
                                              &size, &header, &state) != 1) {
    std::abort();
  }
  return size - 1;
}

std::vector<char> &Buffer() {
  static std::vector<char> buffer(4 << 20);
  return buffer;
}

void Measure(benchmark::State &state, const std::function<size_t(char *, size_t)> &render) {
  for (auto _ : state) benchmark::DoNotOptimize(render(Buffer().data(), Buffer().size()));
  state.counters["ns/line"] = benchmark::Counter(
      kRecords * 1e-9, benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}

template <unsigned kBits, uint32_t kSmallest = 0>
void AddLines(const morwick::LineKernel &kernel, const char *numbers) {
  const auto write = [&kernel](char *output, size_t) {
    char *end = output;
    for (uint32_t i = 0; i < kRecords; ++i) {
      end = kernel.write(end, reinterpret_cast<const uint8_t *>(&Records<kBits, kSmallest>()[i]));
    }
    return static_cast<size_t>(end - output);
  };
  const std::string name = std::string("line/") + kernel.name + numbers;
  benchmark::RegisterBenchmark(name.c_str(), Measure, write);
}

std::string Text(size_t (*render)(char *, size_t)) {
  return {Buffer().data(), render(Buffer().data(), Buffer().size())};
}

}  // namespace

int main(int argc, char **argv) {
  // A comparison counts only between equal texts.
  const std::string fixed = Text(Fixed);
  if (fixed != Text(PlainFixed) || fixed != Text(FmtFixed) ||
      Text(Described) != Text(PlainDescribed)) {
    std::fputs("the versions differ in their text\n", stderr);
    return 1;
  }
  benchmark::RegisterBenchmark("fixed/formatter", Measure, Fixed);
  benchmark::RegisterBenchmark("fixed/plain", Measure, PlainFixed);
  benchmark::RegisterBenchmark("fixed/libfmt", Measure, FmtFixed);
  benchmark::RegisterBenchmark("described/formatter", Measure, Described);
  benchmark::RegisterBenchmark("described/plain", Measure, PlainDescribed);
  for (const morwick::LineKernel &kernel : morwick::LineKernels()) {
    if (!kernel.runs()) {
      std::fprintf(stderr, "this processor has no %s\n", kernel.name);
      continue;
    }
    AddLines<32>(kernel, "/mixed");
    AddLines<3>(kernel, "/1 digit");
    AddLines<26>(kernel, "/up to 8 digits");
    AddLines<30, 1U << 31>(kernel, "/10 digits");
  }
  benchmark::Initialize(&argc, argv);
  benchmark::RunSpecifiedBenchmarks();
}
