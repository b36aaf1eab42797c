// Texts and numbers that come from outside.
#ifndef TOOLS_TEXT_H
#define TOOLS_TEXT_H

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tools {

// For a terminal: each control character, and each byte that is not UTF-8, becomes a question mark.
// A text keeps its line ends. A line does not, because they would forge a second line.
std::string PrintableLine(std::string_view line);
std::string PrintableText(std::string_view text);

// How many bytes at the end are the beginning of a UTF-8 character whose rest is missing: 0 to 3.
size_t IncompleteEnd(std::string_view text);

// For JSON. ValidText replaces each byte that is not UTF-8 by the replacement character.
bool IsValidText(std::string_view text);
std::string ValidText(std::string_view text);

// Appends a field of CSV (RFC 4180), in quotes where it needs them.
void AppendCsvField(std::string *row, std::string_view field);

// A whole number of decimal digits and nothing else, at most `most`.
std::optional<uint64_t> ParseNumber(std::string_view text, uint64_t most);

// A number of seconds such as 2 or 0.25, at most 10^9.
std::optional<double> ParseSeconds(std::string_view text);

// For tables and series: 12.345.
std::string ThreeDecimals(double number);

}  // namespace tools

#endif
