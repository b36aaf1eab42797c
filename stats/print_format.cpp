// Print formats that come from outside.

#include "stats/print_format.h"

#include <algorithm>
#include <climits>
#include <cstdio>

namespace morwick {
namespace {

constexpr uint64_t kPlainWidth = 8;

// Takes plain text up to the next conversion or the end. %% means %.
FormatText TakeText(std::string_view *rest) {
  FormatText text;
  while (!rest->empty()) {
    const bool percent = rest->front() == '%';
    if (percent && !rest->starts_with("%%")) break;
    text.characters[text.length++] = rest->front();
    rest->remove_prefix(percent ? 2 : 1);
  }
  return text;
}

// At most 14 digits: a format with more has no room for the rest of the conversion.
static_assert(kFormatRoom <= 20);
uint64_t TakeNumber(std::string_view *rest) {
  uint64_t number = 0;
  for (; !rest->empty() && rest->front() >= '0' && rest->front() <= '9'; rest->remove_prefix(1)) {
    number = number * 10 + static_cast<uint64_t>(rest->front() - '0');
  }
  return number;
}

// Takes the next conversion, if it has one of the types.
std::optional<Conversion> TakeConversion(std::string_view *rest, std::string_view types) {
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
  // The C library refuses a larger precision. For a text it would make no difference.
  if (type == 's' && precision > INT_MAX) {
    char *point = &conversion.text[start.find('.')];
    point[0] = 's';
    point[1] = '\0';
  }
  // The precision of a number is its least number of digits; that of a text its most characters.
  conversion.least = std::max(width, type == 's' ? 0 : precision);
  conversion.plain = !hasPrecision && (type == 's' ? width == 0
                                                   : type == 'u' && width <= kPlainWidth &&
                                                         flags.find('-') == std::string_view::npos);
  conversion.pad = flags.find('0') == std::string_view::npos ? ' ' : '0';
  conversion.width = static_cast<uint32_t>(std::clamp<uint64_t>(width, 1, kPlainWidth));
  return conversion;
}

bool AppendText(BoundedWriter &writer, const FormatText &text) {
  return writer.AppendFirst(text.characters, text.length);
}

// Prints like printf. A text that cannot fit is not started, because its padding could take
// seconds.
template <typename Argument>
bool AppendFormatted(BoundedWriter &writer, const Conversion &conversion, Argument argument) {
  return writer.AppendPrinted([&](char *room, size_t size) {
    return size > conversion.least ? std::snprintf(room, size, conversion.text, argument) : -1;
  });
}

}  // namespace

std::optional<PrintFormat> ReadPrintFormat(std::string_view text, Arguments arguments) {
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

bool PrintNumbers(BoundedWriter &writer, const PrintFormat &format,
                  std::span<const uint32_t> numbers) {
  if (!AppendText(writer, format.texts[0])) return false;
  for (size_t i = 0; i < format.conversionCount; ++i) {
    const Conversion &conversion = format.conversions[i];
    const bool appended = conversion.plain
                              ? PrintPadded(writer, numbers[i], conversion.width, conversion.pad)
                              : AppendFormatted(writer, conversion, numbers[i]);
    if (!appended || !AppendText(writer, format.texts[i + 1])) return false;
  }
  return true;
}

bool PrintText(BoundedWriter &writer, const PrintFormat &format, const char *text) {
  if (!AppendText(writer, format.texts[0])) return false;
  if (format.conversionCount == 0) return true;
  const Conversion &conversion = format.conversions[0];
  const bool appended =
      conversion.plain ? writer.Append(text) : AppendFormatted(writer, conversion, text);
  return appended && AppendText(writer, format.texts[1]);
}

}  // namespace morwick
