// Texts and numbers that come from outside.
#ifndef TOOLS_TEXT_H
#define TOOLS_TEXT_H

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tools {

// For a terminal: each control character but the line end, and what is not UTF-8, becomes a
// question mark.
std::string Printable(std::string_view text);

// For JSON: whether all of it is UTF-8; what is not becomes the replacement character.
bool IsValidText(std::string_view text);
std::string ValidText(std::string_view text);

// A whole number of decimal digits and nothing else, at most `most`.
std::optional<uint64_t> ParseNumber(std::string_view text, uint64_t most);

// A number of seconds such as 2 or 0.25, at most 10^9.
std::optional<double> ParseSeconds(std::string_view text);

// For tables and series: 12.345.
std::string ThreeDecimals(double number);

}  // namespace tools

#endif
