// Print formats that come from outside.

#include "stats/print_format.h"

#include <algorithm>

namespace morwick {
namespace {

// Larger numbers are taken for this one: no buffer is as large, and sums of it do not overflow.
constexpr uint64_t kHuge = 1000000000000000000;

// One conversion, such as %-08.3u.
struct Conversion {
  bool left = false;
  bool zeros = false;
  bool plus = false;
  bool blank = false;
  bool alternate = false;
  bool hasPrecision = false;
  uint64_t width = 0;
  uint64_t precision = 0;
  char type = '\0';

  bool IsNumber() const { return std::string_view("diuoxX").find(type) != std::string_view::npos; }
};

// Takes a format apart: stretches of plain text, and the conversions between them.
class FormatReader {
 public:
  explicit FormatReader(std::string_view format) : rest_(format) {}

  bool AtEnd() const { return rest_.empty(); }

  // The plain text up to the next conversion or the end; a doubled % is a piece of its own.
  std::string_view TakeText() {
    const bool doubled = rest_.starts_with("%%");
    const std::string_view text = doubled ? rest_.substr(1, 1) : rest_.substr(0, rest_.find('%'));
    rest_.remove_prefix(doubled ? 2 : text.size());
    return text;
  }

  // True when a conversion is next.
  bool AtConversion() const { return rest_.starts_with('%') && !rest_.starts_with("%%"); }

  Conversion TakeConversion() {
    Conversion conversion;
    rest_.remove_prefix(1);
    while (TakeFlag(&conversion)) {
    }
    conversion.width = TakeNumber();
    if (rest_.starts_with('.')) {
      rest_.remove_prefix(1);
      conversion.hasPrecision = true;
      conversion.precision = TakeNumber();
    }
    if (!rest_.empty()) {
      conversion.type = rest_.front();
      rest_.remove_prefix(1);
    }
    return conversion;
  }

 private:
  bool TakeFlag(Conversion *conversion) {
    if (rest_.empty()) return false;
    switch (rest_.front()) {
      case '-':
        conversion->left = true;
        break;
      case '0':
        conversion->zeros = true;
        break;
      case '+':
        conversion->plus = true;
        break;
      case ' ':
        conversion->blank = true;
        break;
      case '#':
        conversion->alternate = true;
        break;
      default:
        return false;
    }
    rest_.remove_prefix(1);
    return true;
  }

  uint64_t TakeNumber() {
    uint64_t number = 0;
    for (; !rest_.empty() && rest_.front() >= '0' && rest_.front() <= '9'; rest_.remove_prefix(1)) {
      number = std::min(number * 10 + static_cast<uint64_t>(rest_.front() - '0'), kHuge);
    }
    return number;
  }

  std::string_view rest_;
};

template <typename Accept>
bool AsksFor(std::string_view format, size_t arguments, Accept accept) {
  FormatReader reader(format);
  size_t conversions = 0;
  while (!reader.AtEnd()) {
    if (!reader.AtConversion()) {
      reader.TakeText();
    } else if (!accept(reader.TakeConversion()) || ++conversions > arguments) {
      return false;
    }
  }
  return true;
}

// The parts of a converted number, in print order: sign or base, zeros, digits, in a field.
bool AppendField(BoundedWriter &writer, const Conversion &conversion, std::string_view prefix,
                 uint64_t zeros, std::string_view digits) {
  const uint64_t length = prefix.size() + zeros + digits.size();
  const uint64_t padding = conversion.width > length ? conversion.width - length : 0;
  if (!writer.Fits(length + padding)) return false;
  if (!conversion.left) writer.Fill(' ', padding);
  writer.Append(prefix);
  writer.Fill('0', zeros);
  writer.Append(digits);
  if (conversion.left) writer.Fill(' ', padding);
  return true;
}

// A number in base 8 or 16.
std::string_view Digits(uint32_t value, uint32_t shift, const char *symbols, char *end) {
  char *start = end;
  for (; value != 0 || start == end; value >>= shift)
    *--start = symbols[value & ((1U << shift) - 1)];
  return {start, end};
}

bool AppendNumber(BoundedWriter &writer, const Conversion &conversion, uint32_t value) {
  // What nearly every format asks for.
  if (conversion.type == 'u' && !conversion.hasPrecision && !conversion.left &&
      conversion.width <= 8) {
    return writer.AppendPadded(value,
                               std::max<uint32_t>(static_cast<uint32_t>(conversion.width), 1),
                               conversion.zeros ? '0' : ' ');
  }
  char text[kDecimalRoom];
  std::string_view digits;
  std::string_view prefix;
  switch (conversion.type) {
    case 'd':
    case 'i': {
      const bool negative = static_cast<int32_t>(value) < 0;
      prefix = negative ? "-" : conversion.plus ? "+" : conversion.blank ? " " : "";
      digits = {text, WriteDecimal(text, negative ? 0U - value : value)};
      break;
    }
    case 'o':
      digits = Digits(value, 3, "01234567", std::end(text));
      break;
    case 'x':
      digits = Digits(value, 4, "0123456789abcdef", std::end(text));
      break;
    case 'X':
      digits = Digits(value, 4, "0123456789ABCDEF", std::end(text));
      break;
    default:
      digits = {text, WriteDecimal(text, value)};
      break;
  }
  // A precision is a least number of digits; at 0, the number 0 has none.
  if (conversion.hasPrecision && conversion.precision == 0 && value == 0) digits = "";
  uint64_t zeros = conversion.precision > digits.size() ? conversion.precision - digits.size() : 0;
  if (conversion.alternate) {
    if (conversion.type == 'o' && zeros == 0 && !digits.starts_with('0')) zeros = 1;
    if (conversion.type == 'x' && value != 0) prefix = "0x";
    if (conversion.type == 'X' && value != 0) prefix = "0X";
  }
  // Zeros up to the width, unless something else decides how many digits there are.
  const uint64_t length = prefix.size() + zeros + digits.size();
  if (conversion.zeros && !conversion.left && !conversion.hasPrecision &&
      conversion.width > length) {
    zeros += conversion.width - length;
  }
  return AppendField(writer, conversion, prefix, zeros, digits);
}

// Prints the text of the format and hands each conversion on.
template <typename AppendArgument>
bool Print(BoundedWriter &writer, std::string_view format, AppendArgument append) {
  FormatReader reader(format);
  while (!reader.AtEnd()) {
    if (!(reader.AtConversion() ? append(reader.TakeConversion())
                                : writer.Append(reader.TakeText()))) {
      return false;
    }
  }
  return true;
}

}  // namespace

bool AsksForNumbersOnly(std::string_view format, size_t numbers) {
  return AsksFor(format, numbers, [](const Conversion &asked) { return asked.IsNumber(); });
}

bool AsksForOneTextOnly(std::string_view format) {
  return AsksFor(format, 1, [](const Conversion &asked) { return asked.type == 's'; });
}

bool PrintNumbers(BoundedWriter &writer, std::string_view format,
                  std::span<const uint32_t> numbers) {
  auto number = numbers.begin();
  return Print(writer, format, [&](const Conversion &conversion) {
    return AppendNumber(writer, conversion, *number++);
  });
}

bool PrintText(BoundedWriter &writer, std::string_view format, std::string_view text) {
  return Print(writer, format, [&](const Conversion &conversion) {
    const uint64_t length = conversion.hasPrecision ? conversion.precision : text.size();
    return AppendField(writer, conversion, "", 0, text.substr(0, length));
  });
}

}  // namespace morwick
