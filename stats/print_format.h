// Print formats that come from outside: taken apart and checked first, so that the C library is
// never asked for anything that was not checked.
#ifndef STATS_PRINT_FORMAT_H
#define STATS_PRINT_FORMAT_H

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
};

// One conversion, such as %-08.3u.
struct Conversion {
  char text[kFormatRoom] = {};  // ended by a NUL
  uint64_t least = 0;           // characters that it prints, whatever its argument
  // A text as it stands, or an unsigned number in a field of at most eight characters: nearly all
  // there is. Those are printed without the C library, in a fifth of the time.
  bool plain = false;
  char pad = ' ';
  uint32_t width = 1;
};

// A format taken apart: plain text, then a conversion and plain text in turn.
struct PrintFormat {
  static constexpr size_t kMostConversions = 2;

  FormatText texts[kMostConversions + 1];
  Conversion conversions[kMostConversions];
  size_t conversionCount = 0;
};

// What a format may ask for.
enum class Arguments { kOneNumber, kTwoNumbers, kOneText };

// Takes apart a format shorter than kFormatRoom. Nothing when it asks for anything else than (fewer
// of) these arguments.
std::optional<PrintFormat> ReadPrintFormat(std::string_view text, Arguments arguments);

// As WritePadded does, where it fits.
inline bool PrintPadded(BoundedWriter &writer, uint32_t number, uint32_t width, char pad) {
  return writer.AppendWritten<kPaddedRoom>(
      [=](char *room) { return WritePadded(room, number, width, pad); });
}

// Print what printf would. False when it does not fit, at a cost of no more than what fits.
bool PrintNumbers(BoundedWriter &writer, const PrintFormat &format,
                  std::span<const uint32_t> numbers);
bool PrintText(BoundedWriter &writer, const PrintFormat &format, const char *text);

}  // namespace morwick

#endif
