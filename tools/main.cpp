// morwick: the command for people and scripts that work with controller statistics.

#include <CLI/CLI.hpp>
#include <csignal>
#include <exception>
#include <sstream>

#include "tools/commands.h"

namespace {

using tools::Status;

void AddFormat(CLI::App *command, std::string *format, const std::vector<std::string> &choices) {
  command->add_option("-o,--output-format", *format, "How to print")
      ->check(CLI::IsMember(choices))
      ->capture_default_str();
}

Status Run(int argc, char **argv) {
  CLI::App app("Finds storage controllers and turns what they report into text.", "morwick");
  app.set_version_flag("--version", "morwick " MORWICK_VERSION);
  app.require_subcommand(1);

  const CLI::App *find =
      app.add_subcommand("find", "Find the controller and say which statistics it offers");

  CLI::App *stats = app.add_subcommand("stats", "Print the statistics in a dump");
  tools::StatsOptions statsOptions;
  stats->add_option("FILE", statsOptions.file, "The dump; - for standard input")->required();
  stats->add_option("-s,--stream", statsOptions.stream, "Which statistics the dump holds")
      ->check(CLI::IsMember({"kvr", "ftl", "msp"}))
      ->required();
  stats->add_option("-c,--controller", statsOptions.controller,
                    "Class of the controller that it was read from (the first one known)");
  AddFormat(stats, &statsOptions.format, {"normal", "json", "prometheus"});

  CLI::App *snapshot = app.add_subcommand("snapshot", "Print a snapshot, one line an interval");
  tools::SnapshotOptions snapshotOptions;
  snapshot->add_option("FILE", snapshotOptions.file, "The snapshot; - for standard input")
      ->required();
  CLI::Option *header = snapshot->add_option("--header", snapshotOptions.header,
                                             "The snapshot header that describes its layout");
  AddFormat(snapshot, &snapshotOptions.format, {"normal", "csv"});

  CLI::App *capacity =
      app.add_subcommand("capacity", "Print advertised capacities in GB for capacities in MB");
  std::vector<uint32_t> megabytes;
  capacity->add_option("MB", megabytes, "Capacities in megabytes")->required();

  try {
    app.parse(argc, argv);
    if (header->count() > 0 && snapshotOptions.format == "csv") {
      throw CLI::ValidationError("--header", "csv is for the fixed layout only");
    }
  } catch (const CLI::Success &success) {  // --help, --version
    std::ostringstream text;
    app.exit(success, text);
    tools::Output output;
    output.Write(text.str());
    return output.Finish(tools::kGood);
  } catch (const CLI::Error &error) {
    std::fprintf(stderr, "morwick: %s (see morwick --help)\n", error.what());
    return tools::kBadUsage;
  }

  if (find->parsed()) return tools::FindCommand();
  if (stats->parsed()) return tools::StatsCommand(statsOptions);
  if (snapshot->parsed()) return tools::SnapshotCommand(snapshotOptions);
  return tools::CapacityCommand(megabytes);
}

}  // namespace

int main(int argc, char **argv) {
  std::signal(SIGPIPE, SIG_IGN);  // a closed pipe is an error like any other
  try {
    return Run(argc, argv);
  } catch (const std::exception &error) {  // out of memory, before all
    std::fprintf(stderr, "morwick: %s\n", error.what());
    return tools::kBadUsage;
  }
}
