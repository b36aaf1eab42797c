// Cleans texts for terminals, JSON and CSV; reads and writes numbers.
#ifndef TOOLS_TEXT_H
#define TOOLS_TEXT_H

#include <charconv>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <type_traits>

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

// A number from `least` to `most`: decimal digits and nothing else, such as 2, or 0.25 for a
// double.
template <typename Number>
std::optional<Number> ParseNumber(std::string_view text, Number least, Number most) {
  Number number = 0;
  std::from_chars_result result;
  if constexpr (std::is_integral_v<Number>) {
    result = std::from_chars(text.begin(), text.end(), number);
  } else {
    result = std::from_chars(text.begin(), text.end(), number, std::chars_format::fixed);
  }
  if (result.ec != std::errc() || result.ptr != text.end() || text.starts_with('-') ||
      !(number >= least && number <= most)) {
    return std::nullopt;
  }
  return number;
}

// Such as 12.345.
std::string ThreeDecimals(double number);

}  // namespace tools

#endif
