// morwick: the command for people and scripts that work with controller statistics.

#include <fmt/format.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <memory>
#include <new>

#include "tools/commands.h"
#include "tools/memory.h"
#include "tools/options.h"
#include "tools/write_file.h"

namespace tools {
namespace {

// The argument parser needs memory before main begins, where nobody could catch an exception. This
// runs before all constructors of the program: 101 is the first priority that is not reserved.
[[gnu::constructor(101)]] void EndBeforeMainWithoutMemory() {
  std::set_new_handler([] {
    std::fputs("morwick: out of memory\n", stderr);
    std::_Exit(kBadData);
  });
}

const CLI::App *FindCommand(const CLI::App &app, const std::string &name) {
  const auto found =
      app.get_subcommands([&](const CLI::App *command) { return command->get_name() == name; });
  return found.empty() ? nullptr : found.front();
}

std::string KnownCommands(const CLI::App &app) {
  std::vector<std::string> names;
  for (const CLI::App *command : app.get_subcommands({})) names.push_back(command->get_name());
  return fmt::format("{}", fmt::join(names, ", "));
}

void AddHelp(CLI::App &app, Action *action) {
  CLI::App *help = app.add_subcommand("help", "Say what a sub-command does and takes");
  const auto name = std::make_shared<std::string>();
  help->add_option("COMMAND", *name, "The sub-command");
  help->callback([=, &app] {
    const CLI::App *subject = name->empty() ? &app : FindCommand(app, *name);
    if (subject == nullptr)
      throw CLI::ValidationError(*name, "is not a sub-command; choose from " + KnownCommands(app));
    const std::string path = name->empty() ? "morwick" : "morwick " + *name;
    *action = [=, &app] {
      // app.help() would explain the sub-command in use, which is this one.
      return WriteWhole(app.get_formatter()->make_help(subject, path, CLI::AppFormatMode::Normal));
    };
  });
}

// Refuses an option with an empty value, such as --write=. The argument parser would take the next
// word as its value.
void RefuseEmptyValues(int argc, char **argv) {
  for (int i = 1; i < argc; ++i) {
    const std::string_view word = argv[i];
    if (word == "--") break;
    if (word.starts_with("--") && word.find('=') == word.size() - 1) {
      throw CLI::ValidationError(std::string(word.substr(0, word.size() - 1)), kValueMissing);
    }
  }
}

// Refuses an option whose value is an empty word.
void RefuseEmptyWords(const CLI::App &command) {
  for (const CLI::Option *option : command.get_options()) {
    if (option->nonpositional() && std::ranges::count(option->results(), "") > 0) {
      throw CLI::ValidationError(option->get_name(), kValueMissing);
    }
  }
}

Status Run(int argc, char **argv) {
  CLI::App app("Finds storage controllers and turns what they report into text.", "morwick");
  app.set_version_flag("--version",
                       "morwick " MORWICK_VERSION " (platform " MORWICK_PLATFORM_NAME ")");
  app.require_subcommand(1);
  Action action;
#define ADD(name) Add##name(app, &action);
  FOR_EACH_COMMAND(ADD)
#undef ADD
  AddHelp(app, &action);

  const std::string first = argc > 1 ? argv[1] : "";
  // app.get_option() would end the program when memory is refused.
  const auto isFirst = [&](const CLI::Option *option) { return option->check_name(first); };
  if (FindCommand(app, first) == nullptr && app.get_options(isFirst).empty()) {
    return RefuseUsage((first.empty() ? "name a sub-command: "
                                      : "'" + first + "' is not a sub-command; choose from ") +
                       KnownCommands(app));
  }
  try {
    RefuseEmptyValues(argc, argv);
    app.parse(argc, argv);
    RefuseEmptyWords(*app.get_subcommands().front());
  } catch (const CLI::CallForHelp &) {
    return WriteWhole(app.help());
  } catch (const CLI::CallForVersion &version) {
    return WriteWhole(version.what() + std::string("\n"));
  } catch (const CLI::Error &error) {
    return RefuseUsage(error.what(), "help " + first);
  }
  return action();
}

}  // namespace
}  // namespace tools

int main(int argc, char **argv) {
  tools::PrepareStreams();
  tools::LimitMemory();
  tools::Status status = tools::kBadData;
  try {
    status = tools::Run(argc, argv);
  } catch (const std::bad_alloc &) {
    tools::RememberMemoryRefusal();
  } catch (const std::exception &error) {
    std::fprintf(stderr, "morwick: %s\n", error.what());
  }
  if (!tools::MemoryWasRefused()) return status;
  tools::ComplainOfMemory();
  return tools::kBadData;
}
