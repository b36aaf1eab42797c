// morwick diff: prints what changed between two dumps.

#include <fmt/format.h>

#include <algorithm>
#include <memory>

#include "tools/changes.h"
#include "tools/commands.h"
#include "tools/options.h"
#include "tools/text.h"

namespace tools {
namespace {

struct Options : StreamOptions {
  std::string oldFile;
  std::string newFile;
  std::optional<double> seconds;
  bool all = false;
};

void PrintCsv(Output &output, const std::vector<Change> &changes, std::optional<double> seconds) {
  output.Write("name,old,new,difference,rate,remark\n");
  for (const Change &change : changes) {
    output.Write(fmt::format("{}\n", fmt::join(change.Cells(seconds), ",")));
  }
}

// The seconds between two dumps by the controller's own clock, after a note. Nothing when a dump
// lacks the clock, or the clock did not advance.
std::optional<double> TimeBetween(const Statistics &old, const Statistics &now) {
  const std::optional<uint64_t> before = old.Find("calendarTime");
  const std::optional<uint64_t> after = now.Find("calendarTime");
  if (!before || !after || *after <= *before) return std::nullopt;
  Note("diff",
       fmt::format("rates are for {} s, by the calendarTime of both dumps", *after - *before));
  return static_cast<double>(*after - *before);
}

Status Diff(const Options &options) {
  const Dump oldDump = ReadDumpFile(options.oldFile, options.stream, options.className);
  const Dump newDump = ReadDumpFile(options.newFile, options.stream, options.className);
  Status status = std::max(oldDump.status, newDump.status);
  std::optional<Statistics> oldStatistics, newStatistics;
  std::optional<std::vector<Change>> changes;
  std::optional<double> seconds = options.seconds;
  if (oldDump.bytes && newDump.bytes) {
    oldStatistics.emplace(oldDump, options.stream, options.filter);
    newStatistics.emplace(newDump, options.stream, options.filter);
    status = oldStatistics->Check(oldDump);
    status = std::max(status, newStatistics->Check(newDump));
    if (!seconds) seconds = TimeBetween(*oldStatistics, *newStatistics);
    changes = FindChanges(*oldStatistics, *newStatistics, options.all, newDump.subject);
    if (!changes) {  // memory was refused: free some for the output
      oldStatistics.reset();
      newStatistics.reset();
      status = kBadData;
    }
  }
  Output output;
  if (options.format == Format::kJson) {
    Json json(output, "diff", {{"old", options.oldFile}, {"new", options.newFile}});
    json.Member("stream", fleet::NameOf(options.stream));
    PrintChanges(json, changes.value_or(std::vector<Change>()), seconds);
    status = json.Finish(status);
  } else if (changes && options.format == Format::kCsv) {
    PrintCsv(output, *changes, seconds);
  } else if (changes) {
    for (const std::string &line : TableOf(*changes, seconds)) output.Write(line + "\n");
  }
  return output.Finish(status);
}

}  // namespace

void AddDiff(CLI::App &app, Action *action) {
  CLI::App *command = app.add_subcommand("diff", "Print what changed between two dumps");
  const auto options = std::make_shared<Options>();
  AddStream(command, &options->stream);
  AddNames(command, &options->names);
  command->add_option("OLD", options->oldFile, "The earlier dump")->required()->type_name("");
  command->add_option("NEW", options->newFile, "The later dump; one may be - for standard input")
      ->required()
      ->type_name("");
  AddNumber(command, "--seconds", &options->seconds, 0.0, kMostSeconds,
            "The time between them, for rates; else by their calendarTime");
  command->add_flag("--all", options->all, "List also what did not change");
  AddController(command, &options->className, "Where the dumps are from");
  AddFormat(command, &options->format, {Format::kNormal, Format::kJson, Format::kCsv});
  command->callback([=] {
    options->filter = MakeFilter({&options->stream, 1}, options->names);
    if (options->oldFile == "-" && options->newFile == "-") {
      throw CLI::ValidationError("OLD, NEW", "standard input can be read only once");
    }
    if (options->seconds == 0) throw CLI::ValidationError("--seconds", "must be above 0");
    *action = [=] { return Diff(*options); };
  });
}

}  // namespace tools
