// Options that several sub-commands share.
#ifndef TOOLS_OPTIONS_H
#define TOOLS_OPTIONS_H

#include <CLI/CLI.hpp>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "fleet/columns.h"
#include "fleet/streams.h"

namespace tools {

enum class Format { kNormal, kJson, kCsv };

using Filter = std::shared_ptr<const fleet::Selection>;

// The options that commands share which read one stream of statistics.
struct StreamOptions {
  MorwickStream stream = kMorwickKVR;
  std::vector<std::string> names;
  Filter filter;  // of the names
  std::string className;
  Format format = Format::kNormal;
};

// -o, --output-format: one of the choices. The first one is the default.
void AddFormat(CLI::App *command, Format *format, const std::vector<Format> &choices);

// -s, --stream: required.
void AddStream(CLI::App *command, MorwickStream *stream);

// -n, --names: names of statistics, separated by commas or in several options.
void AddNames(CLI::App *command, std::vector<std::string> *names);

// The statistics with these names; all of them when there are no names. A name that no stream has
// is wrong usage.
Filter Select(std::span<const MorwickStream> streams, const std::vector<std::string> &names);

// As Select, but null without names.
Filter MakeFilter(std::span<const MorwickStream> streams, const std::vector<std::string> &names);

// -c, --controller: a class that the library knows.
void AddController(CLI::App *command, std::string *className, const std::string &description);

// -w, --write: the name of a file, instead of standard output.
void AddWrite(CLI::App *command, std::string *file, const std::string &description);

// A number of seconds, at least `least`, with or without a fraction.
void AddSeconds(CLI::App *command, const std::string &name, std::optional<double> *seconds,
                double least, const std::string &description);

// A whole number from `least` to `most`.
void AddNumber(CLI::App *command, const std::string &name, uint64_t *number, uint64_t least,
               uint64_t most, const std::string &description);

}  // namespace tools

#endif
