#include "tools/options.h"

#include <algorithm>
#include <sstream>

#include "fleet/controllers.h"
#include "tools/messages.h"

namespace tools {
namespace {

std::string NameOf(Format format) {
  switch (format) {
    case Format::kNormal: return "normal";
    case Format::kJson: return "json";
    case Format::kCsv: return "csv";
  }
  return "";
}

}  // namespace

void AddFormat(CLI::App *command, Format *format, const std::vector<Format> &choices) {
  std::vector<std::string> names(choices.size());
  std::ranges::transform(choices, names.begin(), NameOf);
  *format = choices.front();
  const auto take = [=](const std::string &name) {
    *format = *std::ranges::find(choices, name, NameOf);
    if (*format == Format::kJson) KeepMessages();
  };
  command->add_option_function<std::string>("-o,--output-format", take, "How to print")
      ->check(CLI::IsMember(names))
      ->default_str(names.front());
}

void AddStream(CLI::App *command, MorwickStream *stream) {
  std::vector<std::string> names;
  for (const MorwickStream each : fleet::kStreams) names.emplace_back(fleet::NameOf(each));
  const auto take = [=](const std::string &name) { *stream = *fleet::StreamNamed(name); };
  command->add_option_function<std::string>("-s,--stream", take, "Which statistics")
      ->check(CLI::IsMember(names))
      ->required();
}

void AddNames(CLI::App *command, std::vector<std::string> *lists) {
  command->add_option("-n,--names", *lists, "Only these statistics; 'host*' for all that begin so")
      ->allow_extra_args(false)
      ->type_name("NAMES");
}

Filter Select(std::span<const MorwickStream> streams, const std::vector<std::string> &lists) {
  std::vector<std::string> names;
  for (const std::string &list : lists) {
    std::istringstream parts(list);
    for (std::string name; std::getline(parts, name, ',');) {
      if (!name.empty()) names.push_back(name);
    }
  }
  if (names.empty() && !lists.empty()) throw CLI::ValidationError("--names", kValueMissing);
  try {
    return std::make_shared<const fleet::Selection>(streams, names);
  } catch (const fleet::UnknownName &unknown) {
    throw CLI::ValidationError("--names", unknown.what());
  }
}

Filter MakeFilter(std::span<const MorwickStream> streams, const std::vector<std::string> &lists) {
  return lists.empty() ? nullptr : Select(streams, lists);
}

void AddController(CLI::App *command, std::string *className, const std::string &description) {
  std::vector<std::string> known;
  for (const NandExporter &row : fleet::KnownControllers()) known.emplace_back(row.className);
  command->add_option("-c,--controller", *className, description)->check(CLI::IsMember(known));
}

void AddWrite(CLI::App *command, std::string *file, const std::string &description) {
  const auto take = [=](const std::string &name) {
    if (name == "-")
      throw CLI::ValidationError("--write", "leave it out to write to standard output");
    *file = name;
  };
  command->add_option_function<std::string>("-w,--write", take, description)->type_name("FILE");
}

}  // namespace tools
