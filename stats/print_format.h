// Print formats that come from outside: taken apart and checked first, then printed without the C
// library, so that nothing is ever asked of it that was not checked.
#ifndef STATS_PRINT_FORMAT_H
#define STATS_PRINT_FORMAT_H

#include <cstdint>
#include <span>
#include <string_view>

#include "stats/bounded_writer.h"

namespace morwick {

// One conversion, such as %-08.3u.
struct Conversion {
  bool left = false;
  bool zeros = false;
  bool plus = false;
  bool blank = false;
  bool alternate = false;
  bool hasPrecision = false;
  char type = '\0';
  uint64_t width = 0;
  uint64_t precision = 0;

  // An unsigned number in a field of at most eight characters: nearly all there are.
  bool IsPlain() const { return type == 'u' && !hasPrecision && !left && width <= 8; }
};

// A format taken apart: plain text, then a conversion and plain text in turn.
struct PrintFormat {
  static constexpr size_t kMostConversions = 2;

  ShortText texts[kMostConversions + 1];
  Conversion conversions[kMostConversions];
  size_t conversionCount = 0;
};

// What a format may ask for.
enum class Arguments { kOneNumber, kTwoNumbers, kOneText };

// Takes apart a format shorter than ShortText::kRoom. False when it asks for anything else than
// (fewer of) these arguments.
bool ReadPrintFormat(std::string_view text, Arguments arguments, PrintFormat *format);

// Print what printf would. False when it does not fit, at a cost of no more than what fits.
bool PrintNumbers(BoundedWriter &writer, const PrintFormat &format,
                  std::span<const uint32_t> numbers);
bool PrintText(BoundedWriter &writer, const PrintFormat &format, std::string_view text);

}  // namespace morwick

#endif
