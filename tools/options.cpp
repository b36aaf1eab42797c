// What several sub-commands share in their options.

#include "tools/options.h"

#include "tools/controller.h"
#include "tools/messages.h"
#include "tools/text.h"

namespace tools {

void AddFormat(CLI::App *command, std::string *format, const std::vector<std::string> &choices) {
  *format = choices.front();
  command->add_option("-o,--output-format", *format, "How to print")
      ->check(CLI::IsMember(choices))
      ->capture_default_str()
      ->each([](const std::string &choice) {
        if (choice == "json") KeepMessages();
      });
}

void AddStream(CLI::App *command, std::string *stream) {
  command->add_option("-s,--stream", *stream, "Which statistics")
      ->check(CLI::IsMember(std::vector<std::string>(std::begin(kStreams), std::end(kStreams))))
      ->required();
}

void AddController(CLI::App *command, std::string *className, const std::string &description) {
  std::vector<std::string> known;
  for (const NandExporter &row : KnownControllers()) known.emplace_back(row.className);
  command->add_option("-c,--controller", *className, description)->check(CLI::IsMember(known));
}

void AddWrite(CLI::App *command, std::string *file, const std::string &description) {
  const auto take = [=](const std::string &name) {
    if (name == "-") throw CLI::ValidationError("--write", "standard output goes without it");
    *file = name;
  };
  command->add_option_function<std::string>("-w,--write", take, description)->type_name("FILE");
}

CLI::Option *AddSeconds(CLI::App *command, const std::string &name, double *seconds,
                        const std::string &description) {
  const auto take = [=](const std::string &text) {
    const std::optional<double> value = ParseSeconds(text);
    if (!value)
      throw CLI::ValidationError(name, text + " is no number of seconds up to 1000000000");
    *seconds = *value;
  };
  return command->add_option_function<std::string>(name, take, description)->type_name("SECONDS");
}

void AddNumber(CLI::App *command, const std::string &name, uint64_t *number, uint64_t most,
               const std::string &description) {
  const auto take = [=](const std::string &text) {
    const std::optional<uint64_t> value = ParseNumber(text, most);
    if (!value) {
      throw CLI::ValidationError(name, text + " is no whole number up to " + std::to_string(most));
    }
    *number = *value;
  };
  command->add_option_function<std::string>(name, take, description)->type_name("NUMBER");
}

}  // namespace tools
