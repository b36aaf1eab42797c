// morwick read: saves a buffer of a controller as it came.

#include <memory>

#include "tools/commands.h"
#include "tools/controller.h"
#include "tools/options.h"
#include "tools/write_file.h"

namespace tools {
namespace {

struct Options {
  std::string kind;
  std::string file;  // empty for standard output
  std::string className;
};

Status Read(const Options &options) {
  if (options.file.empty() && OutputIsTerminal()) {
    Complain("standard output", "is a terminal; name a file with -w");
    return kBadUsage;
  }
  std::optional<std::string> bytes;
  {
    Controller controller(options.className, options.kind);  // close it before writing
    if (controller.connected()) bytes = controller.Read(*FindBufferKind(options.kind));
  }
  return bytes ? WriteWhole(*bytes, options.file) : kBadData;
}

}  // namespace

void AddRead(CLI::App &app, Action *action) {
  CLI::App *command = app.add_subcommand("read", "Save a buffer of a controller as it came");
  const auto options = std::make_shared<Options>();
  std::vector<std::string> kinds;
  for (const BufferKind &kind : fleet::BufferKinds()) kinds.emplace_back(kind.name);
  kinds.insert(kinds.end(), {"kvr", "ftl"});
  command->add_option("BUFFER", options->kind, "Which buffer")
      ->check(CLI::IsMember(kinds))
      ->required();
  AddWrite(command, &options->file, "Write to a file, whole or not at all");
  AddController(command, &options->className, "Read from this one instead of the first");
  command->callback([=] { *action = [=] { return Read(*options); }; });
}

}  // namespace tools
