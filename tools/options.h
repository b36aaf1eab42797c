// Options that several sub-commands share.
#ifndef TOOLS_OPTIONS_H
#define TOOLS_OPTIONS_H

#include <fmt/format.h>

#include <CLI/CLI.hpp>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "fleet/columns.h"
#include "fleet/streams.h"
#include "tools/text.h"

namespace tools {

enum class Format { kNormal, kJson, kCsv };

using Filter = std::shared_ptr<const fleet::Selection>;

// The options of the commands that read one stream of statistics.
struct StreamOptions {
  MorwickStream stream = kMorwickKVR;
  std::vector<std::string> names;
  Filter filter;  // made of the names; null without names
  std::string className;
  Format format = Format::kNormal;
};

// -o, --output-format: one of the choices. The first one is the default.
void AddFormat(CLI::App *command, Format *format, const std::vector<Format> &choices);

// -s, --stream: required.
void AddStream(CLI::App *command, MorwickStream *stream);

inline constexpr char kValueMissing[] = "a value is missing";

// -n, --names: lists of statistics, whose names are separated by commas.
void AddNames(CLI::App *command, std::vector<std::string> *lists);

// The statistics of these lists; all of them when there are no lists. A name that no stream has
// is wrong usage, and so are lists without a name.
Filter Select(std::span<const MorwickStream> streams, const std::vector<std::string> &lists);

// Calls Select; null when there are no lists.
Filter MakeFilter(std::span<const MorwickStream> streams, const std::vector<std::string> &lists);

// -c, --controller: a class that the library knows.
void AddController(CLI::App *command, std::string *className, const std::string &description);

// -w, --write: the name of a file, instead of standard output.
void AddWrite(CLI::App *command, std::string *file, const std::string &description);

constexpr double kMostSeconds = 1e9;  // as nanoseconds they fit 64 bits

// An option with a number from `least` to `most`: whole, or seconds when `Number` is a double.
template <typename Number, typename Value>
void AddNumber(CLI::App *command, const std::string &name, Value *value, Number least, Number most,
               const std::string &description) {
  constexpr bool kIsWhole = std::is_integral_v<Number>;
  const auto take = [=](const std::string &text) {
    const std::optional<Number> number = ParseNumber(text, least, most);
    if (!number) {
      throw CLI::ValidationError(
          name.substr(name.find("--")),
          fmt::format("{} is not a {} from {} to {}", text,
                      kIsWhole ? "whole number" : "number of seconds", least, most));
    }
    *value = *number;
  };
  command->add_option_function<std::string>(name, take, description)
      ->type_name(kIsWhole ? "NUMBER" : "SECONDS");
}

}  // namespace tools

#endif
