// Print formats that come from outside: checked first, then printed without the C library, so that
// nothing is ever asked of it that was not checked.
#ifndef STATS_PRINT_FORMAT_H
#define STATS_PRINT_FORMAT_H

#include <cstdint>
#include <span>
#include <string_view>

#include "stats/bounded_writer.h"

namespace morwick {

// True when the format asks for at most `numbers` unsigned integers and nothing else.
bool AsksForNumbersOnly(std::string_view format, size_t numbers);

// True when the format asks for at most one text and nothing else.
bool AsksForOneTextOnly(std::string_view format);

// Print what printf would, for a format that has passed its check with as many arguments. False
// when it does not fit, at a cost of no more than what fits.
bool PrintNumbers(BoundedWriter &writer, std::string_view format,
                  std::span<const uint32_t> numbers);
bool PrintText(BoundedWriter &writer, std::string_view format, std::string_view text);

}  // namespace morwick

#endif
