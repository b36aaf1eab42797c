// What several sub-commands share in their options.
#ifndef TOOLS_OPTIONS_H
#define TOOLS_OPTIONS_H

#include <CLI/CLI.hpp>
#include <string>
#include <vector>

namespace tools {

// -o, --output-format: one of the choices, of which the first is the default.
void AddFormat(CLI::App *command, std::string *format, const std::vector<std::string> &choices);

// -s, --stream: kvr, ftl or msp; required.
void AddStream(CLI::App *command, std::string *stream);

// -c, --controller: a class that the library knows.
void AddController(CLI::App *command, std::string *className, const std::string &description);

// -w, --write: a file with a name; standard output is what there is without it.
void AddWrite(CLI::App *command, std::string *file, const std::string &description);

// Seconds, 0 or more, fractions too.
CLI::Option *AddSeconds(CLI::App *command, const std::string &name, double *seconds,
                        const std::string &description);

// A whole number of digits, at most `most`.
void AddNumber(CLI::App *command, const std::string &name, uint64_t *number, uint64_t most,
               const std::string &description);

}  // namespace tools

#endif
