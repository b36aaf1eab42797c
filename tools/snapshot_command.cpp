// morwick snapshot: prints a snapshot as the library's text, as CSV or JSON, or its summary.

#include <fmt/format.h>

#include <algorithm>
#include <charconv>
#include <memory>
#include <new>

#include "fleet/judge.h"
#include "fleet/snapshot_header.h"
#include "fleet/snapshot_text.h"
#include "tools/commands.h"
#include "tools/controller.h"
#include "tools/input.h"
#include "tools/likely_content.h"
#include "tools/options.h"
#include "tools/snapshot_columns.h"
#include "tools/snapshot_records.h"
#include "tools/snapshot_summary.h"
#include "tools/text.h"

namespace tools {
namespace {

struct Options {
  std::string file;
  bool live = true;
  std::optional<std::string> header;  // a file
  bool fixed = false;
  std::string className;
  Format format = Format::kNormal;
  bool summary = false;
};

// A snapshot that is about to be printed.
struct Snapshot {
  Source source;
  std::string name;                   // in complaints
  std::optional<std::string> header;  // none: the fixed layout
  std::string headerName;
  std::optional<std::string> bytes;        // read from a controller; none: read the file
  std::optional<SnapshotColumns> columns;  // unless the text is printed
  Status status = kGood;
};

// Reads snapshot and header through one connection.
void ReadLive(const Options &options, Snapshot *snapshot) {
  const BufferKind &snapshotKind = *FindBufferKind("snapshot");
  const BufferKind &headerKind = *FindBufferKind("snapshot_header");
  Controller controller(options.className, std::string(snapshotKind.name));
  snapshot->source = {"controller", controller.name()};
  snapshot->name = controller.name() + ": " + std::string(snapshotKind.name);
  snapshot->headerName = controller.name() + ": " + std::string(headerKind.name);
  snapshot->status = kBadData;
  if (!controller.connected()) return;
  if (!options.header && !options.fixed && controller.Offers(headerKind)) {
    snapshot->header = controller.Read(headerKind);
    if (!snapshot->header) return;
  }
  snapshot->bytes = controller.Read(snapshotKind);
  if (snapshot->bytes) snapshot->status = kGood;
}

// Checks the header, if there is one, and takes the columns from it if they are needed. Returns its
// fault; empty for a good one.
std::string CheckLayout(const Options &options, Snapshot *snapshot) {
  if (snapshot->header) {
    std::string fault = fleet::CheckSnapshotHeader(*snapshot->header);
    if (!fault.empty()) return fault;
  }
  if (options.format == Format::kNormal && !options.summary) return "";
  snapshot->columns.emplace(snapshot->header ? snapshot->header->data() : nullptr);
  if (!snapshot->columns->fault().empty() || !options.summary) return snapshot->columns->fault();
  const std::string missing = MissingForSummary(*snapshot->columns);
  return missing.empty() ? "" : "does not describe " + missing + ", which --summary needs";
}

// Reads and checks everything except the records of a file.
Snapshot Prepare(const Options &options) {
  Snapshot snapshot;
  snapshot.source = {"file", options.file};
  snapshot.name = DisplayName(options.file);
  if (options.live) {
    NoteUnreadInput();
    ReadLive(options, &snapshot);
  }
  if (snapshot.status == kGood && options.header) {
    snapshot.headerName = DisplayName(*options.header);
    WholeInput header = ReadInput(*options.header, fleet::kLargestHeader);
    snapshot.status = header.status;
    snapshot.header = std::move(header.bytes);
  }
  if (snapshot.status != kGood) return snapshot;
  const std::string fault = CheckLayout(options, &snapshot);
  if (!fault.empty()) {
    Complain(snapshot.headerName, fault);
    snapshot.status = kBadData;
  }
  return snapshot;
}

// Each function below that returns a bool returns false when reading has failed.

// The library's text: legend, lines, an empty line.
bool PrintFixedText(Output &output, SnapshotRecords &records) {
  fleet::FixedText text([&](std::string_view piece) { return output.Write(piece); });
  text.Begin();
  const bool good = records.ForEachBlock(
      [&](std::string_view block) { return text.Print(block) && output.Flush(); });
  if (good) text.End();
  return good;
}

// The library's text in the layout of the header. Records that are too long make the status bad. A
// hostile file may have millions, so the first few are named and the others are counted.
bool PrintDescribedText(Output &output, SnapshotRecords &records, const Snapshot &snapshot,
                        Status *status) {
  constexpr uint64_t kMostNamed = 3;
  fleet::DescribedText text([&](std::string_view piece) { return output.Write(piece); },
                            *snapshot.header);
  const std::string tooLong =
      fmt::format("not fit a text of {} bytes", fleet::DescribedText::kMostText);
  uint64_t passedOver = 0;
  const bool good = records.ForEachBlock([&](std::string_view block) {
    const uint64_t first = records.count() - block.size() / records.recordSize();
    const auto passOver = [&](uint32_t index) {
      if (++passedOver > kMostNamed) return;
      Complain(snapshot.name, fmt::format("record {} does {}", first + index, tooLong));
    };
    return text.Print(block, passOver) && output.Flush();
  });
  if (passedOver > kMostNamed) {
    Complain(snapshot.name, fmt::format("{} more records do {}", passedOver - kMostNamed, tooLong));
  }
  if (passedOver > 0) *status = kBadData;
  return good;
}

// Calls `take` with each record that the text does not leave out. The output, if `take` writes to
// one, is flushed after each block.
template <typename TakeRecord>
bool ForEachRecord(SnapshotRecords &records, const SnapshotColumns &columns, Output *output,
                   TakeRecord take) {
  return records.ForEachBlock([&](std::string_view block) {
    for (; !block.empty(); block.remove_prefix(records.recordSize())) {
      const std::string_view record = block.substr(0, records.recordSize());
      if (!columns.LeavesOut(record)) take(record);
    }
    return output == nullptr || output->Flush();
  });
}

bool PrintCsv(Output &output, SnapshotRecords &records, const SnapshotColumns &columns) {
  std::string row;
  for (const SnapshotColumn &column : columns.all()) {
    if (!row.empty()) row += ',';
    AppendCsvField(&row, column.name);
  }
  output.Write(row += '\n');
  return ForEachRecord(records, columns, &output, [&](std::string_view record) {
    row.clear();
    for (const SnapshotColumn &column : columns.all()) {
      if (!row.empty()) row += ',';
      char digits[16];
      row.append(
          digits,
          std::to_chars(digits, std::end(digits), LoadLittleEndian32(&record[column.offset])).ptr);
    }
    output.Write(row += '\n');
  });
}

bool PrintRows(Output &output, Json &json, SnapshotRecords &records,
               const SnapshotColumns &columns) {
  json.Array("columns", columns.all(),
             [&](const SnapshotColumn &column) { json.Text(column.name); });
  json.Key("rows");
  json.BeginArray();
  const bool good = ForEachRecord(records, columns, &output, [&](std::string_view record) {
    json.BeginArray();
    for (const SnapshotColumn &column : columns.all()) {
      json.Number(LoadLittleEndian32(&record[column.offset]));
    }
    json.EndArray();
  });
  json.EndArray();
  return good;
}

// Flushes only after all records: if memory is refused, no half object is left.
bool PrintSummary(Output &output, Json *json, SnapshotRecords &records,
                  const SnapshotColumns &columns) {
  SnapshotSummary summary(columns);
  const bool good = ForEachRecord(records, columns, nullptr,
                                  [&](std::string_view record) { summary.Add(record); });
  if (json == nullptr) {
    summary.Print(output);
  } else {
    summary.Print(*json);
  }
  return good;
}

// Says where the records end, unless they end as promised.
Status JudgeEnd(const Snapshot &snapshot, const SnapshotRecords &records, uint64_t promised) {
  const auto promisedRecords = [&] {
    return fmt::format("{} records that {} promises", promised, snapshot.headerName);
  };
  if (snapshot.header && records.count() < promised) {
    Complain(snapshot.name, fmt::format("ends after {} of {}", records.count(), promisedRecords()));
    return kBadData;
  }
  if (!snapshot.header && records.rest() > 0) {
    Complain(snapshot.name,
             fmt::format("the rest, {}, is not a whole record", fleet::Bytes(records.rest())));
    return kBadData;
  }
  if (records.rest() > records.recordSize()) {  // more than the record that is not printed
    Note(snapshot.name, "goes on after the " + promisedRecords());
  }
  return kGood;
}

Status PrintRecords(const Options &options, const Snapshot &snapshot, Output &output, Json *json) {
  if (snapshot.status != kGood) return snapshot.status;
  size_t recordSize = sizeof(SnapshotRecord);
  uint64_t promised = UINT64_MAX;
  if (snapshot.header) {
    const SnapshotHeader numbers = fleet::LoadSnapshotHeader(*snapshot.header);
    recordSize = numbers.recordSize;
    promised = numbers.recordCount == 0 ? 0 : numbers.recordCount - 1;  // the last is not printed
  }
  std::optional<Input> input;
  if (!snapshot.bytes) input.emplace(options.file, !OutputIsTerminal());
  size_t taken = 0;
  const auto read = [&](char *bytes, size_t room) -> std::optional<size_t> {
    if (input) return input->Read(bytes, room);
    const size_t count = snapshot.bytes->copy(bytes, room, taken);
    taken += count;
    return count;
  };
  SnapshotRecords records(read, recordSize, promised);
  if (!records.Load()) return kUnreadable;
  if (records.rest() == 0) {
    Complain(snapshot.name, "there is nothing in it");
    return kBadData;
  }
  const std::string other = OtherThanSnapshot(records.loaded());
  if (!snapshot.header && !other.empty()) {
    Note(snapshot.name, "looks like " + other + ", not like a snapshot");
  }
  Status status = kGood;
  bool good = true;
  if (options.summary) {
    good = PrintSummary(output, json, records, *snapshot.columns);
  } else if (json != nullptr) {
    good = PrintRows(output, *json, records, *snapshot.columns);
  } else if (options.format == Format::kCsv) {
    good = PrintCsv(output, records, *snapshot.columns);
  } else if (snapshot.header) {
    good = PrintDescribedText(output, records, snapshot, &status);
  } else {
    good = PrintFixedText(output, records);
  }
  if (!good) return kUnreadable;
  if (!output.Flush()) return status;  // the end may not have been reached
  return std::max(status, JudgeEnd(snapshot, records, promised));
}

Status Print(const Options &options) {
  const Snapshot snapshot = Prepare(options);
  Output output;
  if (options.format != Format::kJson) {
    return output.Finish(PrintRecords(options, snapshot, output, nullptr));
  }
  Json json(output, "snapshot", {snapshot.source});
  const Status status = PrintRecords(options, snapshot, output, &json);
  return output.Finish(json.Finish(status));
}

}  // namespace

void AddSnapshot(CLI::App &app, Action *action) {
  CLI::App *command =
      app.add_subcommand("snapshot", "Print a snapshot of a controller, or of a file");
  const auto options = std::make_shared<Options>();
  CLI::Option *file =
      command->add_option("FILE", options->file, "A snapshot; - for standard input")->type_name("");
  CLI::Option *header =
      command->add_option("--header", options->header, "The header that describes its layout")
          ->type_name("FILE");
  command->add_flag("--fixed", options->fixed, "In the fixed layout, whatever header there is")
      ->excludes(header);
  command->add_flag("--summary", options->summary, "What it says as a whole");
  AddController(command, &options->className, "Read from this one instead of the first");
  AddFormat(command, &options->format, {Format::kNormal, Format::kJson, Format::kCsv});
  command->callback([=] {
    options->live = file->count() == 0;
    if (!options->live && !options->className.empty()) {
      throw CLI::ValidationError("--controller", "cannot be used with a file");
    }
    if (options->summary && options->format == Format::kCsv) {
      throw CLI::ValidationError("--summary", "is not printed as csv");
    }
    if (options->file == "-" && options->header == "-") {
      throw CLI::ValidationError("--header", "standard input can be read only once");
    }
    *action = [=] { return Print(*options); };
  });
}

}  // namespace tools
