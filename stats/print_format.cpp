// Prints by formats that come from outside.

#include "stats/print_format.h"

#include <cstdio>

namespace morwick {
namespace {

bool AppendText(BoundedWriter &writer, const FormatText &text) {
  return writer.AppendFirst(text.characters, text.length);
}

// Prints like printf. A text that cannot fit is not started: its padding could take seconds.
template <typename Argument>
bool AppendFormatted(BoundedWriter &writer, const Conversion &conversion, Argument argument) {
  return writer.AppendPrinted([&](char *room, size_t size) {
    return size > conversion.leastLength ? std::snprintf(room, size, conversion.text, argument)
                                         : -1;
  });
}

}  // namespace

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
