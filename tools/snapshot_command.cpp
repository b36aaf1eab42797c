// morwick snapshot: prints a snapshot as the library's text or as CSV.

#include <algorithm>

#include "morwick/morwick.h"
#include "tools/commands.h"
#include "tools/snapshot_header.h"
#include "tools/words.h"

namespace tools {
namespace {

// Snapshots go through buffers of fixed size, however long they are.
constexpr uint64_t kRecordsAtOnce = 1000;
constexpr uint64_t kTextRoom = 2048 + kRecordsAtOnce * 1024;  // legend and longest lines
constexpr size_t kBufferSize = 64 << 10;

uint64_t RecordCount(const std::string &snapshot) {
  return snapshot.size() / sizeof(SnapshotRecord);
}

// The library's text of some records: legend, lines and an empty line.
std::string Render(const char *records, uint64_t size) {
  std::string text(kTextRoom, '\0');
  uint64_t length = text.size();
  if (KVRParseSnapshotBuffer(records, size, text.data(), &length) == 0) length = 0;
  text.resize(length);
  return text;
}

// The text of the whole, put together from parts: the legend only once, the empty line at the end.
void PrintFixed(Output &output, const std::string &snapshot) {
  std::string legend = Render(nullptr, 0);
  legend.pop_back();
  output.Write(legend);
  for (uint64_t first = 0; first < RecordCount(snapshot); first += kRecordsAtOnce) {
    const uint64_t count = std::min(kRecordsAtOnce, RecordCount(snapshot) - first);
    std::string text =
        Render(snapshot.data() + first * sizeof(SnapshotRecord), count * sizeof(SnapshotRecord));
    text.pop_back();
    if (!output.Write(std::string_view(text).substr(legend.size()))) return;
  }
  output.Write("\n");
}

std::string Milliseconds(uint32_t microseconds) {
  const std::string hundredths = std::to_string(microseconds % 1000 / 10);
  return std::to_string(microseconds / 1000) + (hundredths.size() < 2 ? ".0" : ".") + hundredths;
}

constexpr char kCsvHeader[] =
    "T,E,HR,HW,NR,NW,TH,GC,W,BI,BU,V,BF_fragments,BF_high_water,P,H_normal,H_extreme,"
    "X_succeeded,X_failed,L_age,L_interval,C_min,C_max,S,U,"
    "RO_0,RO_1,RO_2,RO_3,RL_0,RL_1,RL_2,RL_3,RM_0,RM_1,RM_2,RM_3,"
    "WO_0,WO_1,WO_2,WO_3,WL_0,WL_1,WL_2,WL_3,WM_0,WM_1,WM_2,WM_3\n";

// One row, its fields in the order of the header row.
std::string CsvRow(const SnapshotRecord &record) {
  const uint32_t beforeTime[] = {record.timestamp,  record.erasedBands, record.hostReads,
                                 record.hostWrites, record.nandReads,   record.nandWrites};
  const uint32_t behindTime[] = {
      record.collectedSectors, record.wearLevelBands,     record.intermediatePendingErase,
      record.userPendingErase, record.freeNodes,          record.bufferFragments,
      record.bufferHighWater,  record.preemptPercent,     record.qosDelaysNormal,
      record.qosDelaysExtreme, record.expeditesSucceeded, record.expeditesFailed,
      record.oldestCommandAge, record.qosInterval,        record.commandTagsMin,
      record.commandTagsMax,   record.freeSegments,       record.hostUnmaps};
  std::string row;
  for (const uint32_t value : beforeTime) row += std::to_string(value) + ",";
  row += Milliseconds(record.hysteresisTime);
  for (const uint32_t value : behindTime) row += "," + std::to_string(value);
  for (const auto *operations : {record.reads, record.writes}) {
    for (const auto part : {&SnapshotOperations::count, &SnapshotOperations::totalLatency,
                            &SnapshotOperations::maxLatency}) {
      for (int k = 0; k < 4; ++k) row += "," + std::to_string(operations[k].*part);
    }
  }
  return row + "\n";
}

void PrintCsv(Output &output, const std::string &snapshot) {
  output.Write(kCsvHeader);
  for (uint64_t i = 0; i < RecordCount(snapshot); ++i) {
    const auto bytes = std::string_view(snapshot).substr(i * sizeof(SnapshotRecord));
    if (!output.Write(CsvRow(ReadWords<SnapshotRecord>(bytes)))) return;
  }
}

Status FixedLayout(const SnapshotOptions &options, const std::string &snapshot) {
  Output output;
  if (options.format == "csv") {
    PrintCsv(output, snapshot);
  } else {
    PrintFixed(output, snapshot);
  }
  const uint64_t rest = snapshot.size() % sizeof(SnapshotRecord);
  if (rest == 0) return output.Finish(kGood);
  Complain(DisplayName(options.file),
           "the last " + std::to_string(rest) + " bytes are not a whole record");
  return output.Finish(kBadData);
}

Status DescribedLayout(const SnapshotOptions &options, const std::string &snapshot,
                       const std::string &header) {
  const std::string name = DisplayName(options.file);
  const uint32_t recordCount = ReadWords<SnapshotHeader>(header).recordCount;
  const uint32_t last = recordCount == 0 ? 0 : recordCount - 1;
  Output output;
  Status status = kGood;
  std::string buffer(kBufferSize, '\0');
  uint32_t state = 0;
  for (bool done = false; !done;) {
    const uint32_t start = state;
    uint64_t size = buffer.size();
    done = KVRParseSnapshotBufferWithInplaceParser(snapshot.data(), snapshot.size(), buffer.data(),
                                                   &size, header.data(), &state) == 1;
    if (!output.Write({buffer.data(), size - 1})) break;
    if (done) break;
    if (state == start) {
      Complain(DisplayName(options.header), "the text does not fit a buffer of 64 KiB");
      return output.Finish(kBadData);
    }
    // The buffer was full at a record and passed it over: once more, with the buffer to itself.
    if (size > 1) {
      --state;
    } else {
      Complain(name, "record " + std::to_string(state - 1) + " does not fit a buffer of 64 KiB");
      status = kBadData;
    }
  }
  if (status == kGood && state < last) {
    Complain(name, "ends after " + std::to_string(state) + " of " + std::to_string(last) +
                       " records that the header promises");
    status = kBadData;
  }
  return output.Finish(status);
}

}  // namespace

Status SnapshotCommand(const SnapshotOptions &options) {
  std::optional<std::string> header = std::string();
  if (!options.header.empty()) {
    header = ReadInput(options.header);
    if (!header) return kBadUsage;
    if (const std::string wrong = CheckSnapshotHeader(*header); !wrong.empty()) {
      Complain(DisplayName(options.header), wrong);
      return kBadData;
    }
  }
  const std::optional<std::string> snapshot = ReadInput(options.file);
  if (!snapshot) return kBadUsage;
  if (snapshot->empty()) {
    Complain(DisplayName(options.file), "the file is empty");
    return kBadData;
  }
  return options.header.empty() ? FixedLayout(options, *snapshot)
                                : DescribedLayout(options, *snapshot, *header);
}

}  // namespace tools
