// Print formats that come from outside.

#include "stats/print_format.h"

#include <algorithm>

namespace morwick {
namespace {

// Larger numbers are taken for this one: no buffer is as large, and sums of it do not overflow.
constexpr uint64_t kHuge = 1000000000000000000;

// Walks over a format.
class FormatReader {
 public:
  explicit FormatReader(std::string_view format) : rest_(format) {}

  bool AtEnd() const { return rest_.empty(); }

  // Takes plain text up to the next conversion or the end; a doubled % stands for one.
  ShortText TakeText() {
    ShortText text;
    while (!rest_.empty()) {
      const bool percent = rest_.front() == '%';
      if (percent && !rest_.starts_with("%%")) break;
      text.Append(rest_.front());
      rest_.remove_prefix(percent ? 2 : 1);
    }
    return text;
  }

  // Takes the conversion that is next. Its type is NUL when the format ends in the middle of it.
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
      case '-': conversion->left = true; break;
      case '0': conversion->zeros = true; break;
      case '+': conversion->plus = true; break;
      case ' ': conversion->blank = true; break;
      case '#': conversion->alternate = true; break;
      default: return false;
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

bool AppendPlain(BoundedWriter &writer, const Conversion &conversion, uint32_t value) {
  const auto width = std::max<uint32_t>(static_cast<uint32_t>(conversion.width), 1);
  return writer.AppendPadded(value, width, conversion.zeros ? '0' : ' ');
}

bool AppendNumber(BoundedWriter &writer, const Conversion &conversion, uint32_t value) {
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
    case 'o': digits = Digits(value, 3, "01234567", std::end(text)); break;
    case 'x': digits = Digits(value, 4, "0123456789abcdef", std::end(text)); break;
    case 'X': digits = Digits(value, 4, "0123456789ABCDEF", std::end(text)); break;
    default: digits = {text, WriteDecimal(text, value)}; break;
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

// Prints the plain texts of the format and hands each conversion on.
template <typename AppendArgument>
bool Print(BoundedWriter &writer, const PrintFormat &format, AppendArgument append) {
  if (!writer.Append(format.texts[0])) return false;
  for (size_t i = 0; i < format.conversionCount; ++i) {
    if (!append(format.conversions[i], i) || !writer.Append(format.texts[i + 1])) return false;
  }
  return true;
}

}  // namespace

bool ReadPrintFormat(std::string_view text, Arguments arguments, PrintFormat *format) {
  const std::string_view types = arguments == Arguments::kOneText ? "s" : "diuoxX";
  const size_t most = arguments == Arguments::kTwoNumbers ? 2 : 1;
  *format = {};
  FormatReader reader(text);
  format->texts[0] = reader.TakeText();
  while (!reader.AtEnd()) {
    const Conversion conversion = reader.TakeConversion();
    if (format->conversionCount == most || types.find(conversion.type) == std::string_view::npos) {
      return false;
    }
    format->conversions[format->conversionCount] = conversion;
    format->texts[++format->conversionCount] = reader.TakeText();
  }
  return true;
}

bool PrintNumbers(BoundedWriter &writer, const PrintFormat &format,
                  std::span<const uint32_t> numbers) {
  return Print(writer, format, [&](const Conversion &conversion, size_t index) {
    return conversion.IsPlain() ? AppendPlain(writer, conversion, numbers[index])
                                : AppendNumber(writer, conversion, numbers[index]);
  });
}

bool PrintText(BoundedWriter &writer, const PrintFormat &format, std::string_view text) {
  return Print(writer, format, [&](const Conversion &conversion, size_t) {
    const uint64_t length = conversion.hasPrecision ? conversion.precision : text.size();
    return AppendField(writer, conversion, "", 0, text.substr(0, length));
  });
}

}  // namespace morwick
