// Print formats that come from outside. They are parsed and checked first, so that the C library
// only gets conversions that are known to be safe.
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
  // Nearly all conversions are a plain text, or an unsigned number in at most eight characters.
  // These are printed without the C library, in a fifth of the time.
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

// Parses a format shorter than kFormatRoom. It may use fewer of these arguments. Returns nothing
// when it uses any other.
std::optional<PrintFormat> ReadPrintFormat(std::string_view text, Arguments arguments);

// As WritePadded does, where it fits.
inline bool PrintPadded(BoundedWriter &writer, uint32_t number, uint32_t width, char pad) {
  return writer.AppendWritten<kPaddedRoom>(
      [=](char *room) { return WritePadded(room, number, width, pad); });
}

// Print like printf. False when the text does not fit; the cost then is that of the part that fits.
bool PrintNumbers(BoundedWriter &writer, const PrintFormat &format,
                  std::span<const uint32_t> numbers);
bool PrintText(BoundedWriter &writer, const PrintFormat &format, const char *text);

}  // namespace morwick

#endif
