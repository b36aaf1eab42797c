// Print formats that come from outside. They are parsed and checked first, so that the C library
// only gets conversions that are known to be safe.
#ifndef STATS_PRINT_FORMAT_H
#define STATS_PRINT_FORMAT_H

#include <algorithm>
#include <climits>
#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

#include "stats/bounded_writer.h"
#include "stats/decimal.h"

namespace morwick {

constexpr size_t kFormatRoom = 16;  // of a descriptor's format, its NUL included

// A piece of plain text of a format.
struct FormatText {
  char characters[kFormatRoom] = {};
  size_t length = 0;

  constexpr std::string_view view() const { return {characters, length}; }
};

// One conversion, such as %-08.3u.
struct Conversion {
  char text[kFormatRoom] = {};  // ended by a NUL
  uint64_t leastLength = 0;     // the fewest characters that it prints, whatever its argument
  // Nearly all conversions are a plain text, or an unsigned number in at most eight characters.
  // These are plain: they are printed without the C library, in a fifth of the time.
  bool plain = false;
  char pad = ' ';
  uint32_t width = 1;
};

// A parsed format: plain text, then conversions, each followed by plain text.
struct PrintFormat {
  static constexpr size_t kMostConversions = 2;

  FormatText texts[kMostConversions + 1];
  Conversion conversions[kMostConversions];
  size_t conversionCount = 0;
};

// The arguments that a format may use.
enum class Arguments { kOneNumber, kTwoNumbers, kOneText };

// Takes plain text up to the next conversion or the end. %% means %.
constexpr FormatText TakeText(std::string_view *rest) {
  FormatText text;
  while (!rest->empty()) {
    const bool percent = rest->front() == '%';
    if (percent && !rest->starts_with("%%")) break;
    text.characters[text.length++] = rest->front();
    rest->remove_prefix(percent ? 2 : 1);
  }
  return text;
}

// A format of 15 characters has at most 14 digits, so a number fits 64 bits.
static_assert(kFormatRoom <= 20);
constexpr uint64_t TakeNumber(std::string_view *rest) {
  uint64_t number = 0;
  for (; !rest->empty() && rest->front() >= '0' && rest->front() <= '9'; rest->remove_prefix(1)) {
    number = number * 10 + static_cast<uint64_t>(rest->front() - '0');
  }
  return number;
}

// Takes the next conversion, if it has one of the types.
constexpr std::optional<Conversion> TakeConversion(std::string_view *rest, std::string_view types) {
  constexpr uint64_t kPlainWidth = 8;  // the widest that WritePadded pads
  const std::string_view start = *rest;
  rest->remove_prefix(1);
  const size_t flagCount = std::min(rest->find_first_not_of("-0+ #"), rest->size());
  const std::string_view flags = rest->substr(0, flagCount);
  rest->remove_prefix(flagCount);
  const uint64_t width = TakeNumber(rest);
  const bool hasPrecision = rest->starts_with('.');
  uint64_t precision = 0;
  if (hasPrecision) {
    rest->remove_prefix(1);
    precision = TakeNumber(rest);
  }
  if (rest->empty() || types.find(rest->front()) == std::string_view::npos) return std::nullopt;
  const char type = rest->front();
  rest->remove_prefix(1);

  Conversion conversion;
  start.copy(conversion.text, start.size() - rest->size());
  // The C library refuses a precision above INT_MAX. No text is so long, so it goes without one.
  if (type == 's' && precision > INT_MAX) {
    char *point = &conversion.text[start.find('.')];
    point[0] = 's';
    point[1] = '\0';
  }
  // The precision of a number is its least number of digits; that of a text its most characters.
  conversion.leastLength = std::max(width, type == 's' ? 0 : precision);
  conversion.plain = !hasPrecision && (type == 's' ? width == 0
                                                   : type == 'u' && width <= kPlainWidth &&
                                                         flags.find('-') == std::string_view::npos);
  conversion.pad = flags.find('0') == std::string_view::npos ? ' ' : '0';
  conversion.width = static_cast<uint32_t>(std::clamp<uint64_t>(width, 1, kPlainWidth));
  return conversion;
}

// Parses a format shorter than kFormatRoom. Returns nothing when the format uses other arguments
// than these; it may use fewer.
constexpr std::optional<PrintFormat> ReadPrintFormat(std::string_view text, Arguments arguments) {
  const std::string_view types = arguments == Arguments::kOneText ? "s" : "diuoxX";
  const size_t most = arguments == Arguments::kTwoNumbers ? 2 : 1;
  PrintFormat format;
  format.texts[0] = TakeText(&text);
  while (!text.empty()) {
    if (format.conversionCount == most) return std::nullopt;
    const std::optional<Conversion> conversion = TakeConversion(&text, types);
    if (!conversion) return std::nullopt;
    format.conversions[format.conversionCount] = *conversion;
    format.texts[++format.conversionCount] = TakeText(&text);
  }
  return format;
}

// Appends what WritePadded writes. False when it does not fit.
inline bool PrintPadded(BoundedWriter &writer, uint32_t number, uint32_t width, char pad) {
  return writer.AppendWritten<kPaddedRoom>(
      [=](char *room) { return WritePadded(room, number, width, pad); });
}

// Print like printf. False when the text does not fit, at the cost of the part that fits.
bool PrintNumbers(BoundedWriter &writer, const PrintFormat &format,
                  std::span<const uint32_t> numbers);
bool PrintText(BoundedWriter &writer, const PrintFormat &format, const char *text);

}  // namespace morwick

#endif
