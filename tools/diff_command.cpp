// morwick diff: what changed between two dumps.

#include <algorithm>
#include <memory>

#include "tools/changes.h"
#include "tools/commands.h"
#include "tools/options.h"
#include "tools/text.h"

namespace tools {
namespace {

struct Options {
  std::string stream;
  std::string oldFile;
  std::string newFile;
  std::string className;
  std::string format;
  std::optional<double> seconds;
  bool all = false;
};

void PrintCsv(Output &output, const std::vector<Change> &changes, std::optional<double> seconds) {
  output.Write("name,old,new,difference,rate,remark\n");
  for (const Change &change : changes) {
    const std::optional<double> rate = seconds ? change.Rate(*seconds) : std::nullopt;
    output.Write(change.name);
    output.Put(',');
    if (change.old != nullptr) output.Write(change.old->text);
    output.Put(',');
    if (change.now != nullptr) output.Write(change.now->text);
    output.Write("," + change.Difference() + "," + (rate ? ThreeDecimals(*rate) : "") + "," +
                 std::string(change.Remark()) + "\n");
  }
}

Status Diff(const Options &options) {
  const Dump old = ReadDumpFile(options.oldFile, options.stream, options.className);
  const Dump now = ReadDumpFile(options.newFile, options.stream, options.className);
  Status status = std::max(old.status, now.status);
  std::optional<Statistics> before, after;
  std::optional<std::vector<Change>> changes;
  if (status == kGood) {
    before.emplace(old, options.stream);
    after.emplace(now, options.stream);
    status = before->Judge(old);
    status = std::max(status, after->Judge(now));
    changes = FindChanges(*before, *after, options.all, now.subject);
    if (!changes) {  // their memory is needed to say so
      before.reset();
      after.reset();
      status = kBadData;
    }
  }
  Output output;
  if (options.format == "json") {
    Json json(output, "diff", {{"old", options.oldFile}, {"new", options.newFile}});
    json.Member("stream", options.stream);
    PrintChanges(json, changes.value_or(std::vector<Change>()), options.seconds);
    status = json.Finish(status);
  } else if (changes && options.format == "csv") {
    PrintCsv(output, *changes, options.seconds);
  } else if (changes) {
    PrintChanges(output, *changes, options.seconds);
  }
  return output.Finish(status);
}

}  // namespace

void AddDiff(CLI::App &app, Action *action) {
  CLI::App *command = app.add_subcommand("diff", "Print what changed between two dumps");
  const auto options = std::make_shared<Options>();
  const auto seconds = std::make_shared<double>(0);
  AddStream(command, &options->stream);
  command->add_option("OLD", options->oldFile, "The earlier dump")->required()->type_name("");
  command->add_option("NEW", options->newFile, "The later dump; one may be - for standard input")
      ->required()
      ->type_name("");
  CLI::Option *time =
      AddSeconds(command, "--seconds", seconds.get(), "The time between them, for rates");
  command->add_flag("--all", options->all, "List also what did not change");
  AddController(command, &options->className, "Where the dumps are from");
  AddFormat(command, &options->format, {"normal", "json", "csv"});
  command->callback([=] {
    if (options->oldFile == "-" && options->newFile == "-") {
      throw CLI::ValidationError("OLD, NEW", "standard input can be read only once");
    }
    if (time->count() > 0) {
      if (*seconds == 0) throw CLI::ValidationError("--seconds", "no time has passed");
      options->seconds = *seconds;
    }
    *action = [=] { return Diff(*options); };
  });
}

}  // namespace tools
