#include "tools/text.h"

#include <fmt/format.h>
#include <utf8cpp/utf8.h>

#include <algorithm>

namespace tools {
namespace {

bool IsControl(uint32_t code) { return code < 0x20 || (code >= 0x7f && code < 0xa0); }
bool IsAnything(uint32_t) { return true; }
bool IsPrinted(uint32_t code) { return !IsControl(code); }
bool IsPrintedOrLineEnd(uint32_t code) { return !IsControl(code) || code == '\n'; }

// Copies the wanted characters. Each of the others, and each byte that is not UTF-8, is replaced.
std::string Clean(std::string_view text, bool (*isWanted)(uint32_t code),
                  std::string_view replacement) {
  std::string clean;
  const char *at = text.data();
  const char *const end = at + text.size();
  while (at != end) {
    for (const char *const bad = utf8::find_invalid(at, end); at != bad;) {
      const char *const begin = at;
      if (isWanted(utf8::unchecked::next(at))) {
        clean.append(begin, at);
      } else {
        clean += replacement;
      }
    }
    if (at == end) break;
    clean += replacement;
    ++at;
  }
  return clean;
}

}  // namespace

std::string PrintableLine(std::string_view line) { return Clean(line, IsPrinted, "?"); }

std::string PrintableText(std::string_view text) { return Clean(text, IsPrintedOrLineEnd, "?"); }

size_t IncompleteEnd(std::string_view text) {
  for (size_t length = 1; length <= std::min<size_t>(text.size(), 3); ++length) {
    const auto byte = static_cast<unsigned char>(text[text.size() - length]);
    if (byte >= 0x80 && byte < 0xc0) continue;  // not the first of its character
    const size_t needed = byte < 0xc0 ? 1 : byte < 0xe0 ? 2 : byte < 0xf0 ? 3 : 4;
    return needed > length ? length : 0;
  }
  return 0;
}

bool IsValidText(std::string_view text) { return utf8::is_valid(text.begin(), text.end()); }

std::string ValidText(std::string_view text) { return Clean(text, IsAnything, "\xef\xbf\xbd"); }

void AppendCsvField(std::string *row, std::string_view field) {
  if (field.find_first_of(",\"\r\n") == std::string_view::npos) {
    row->append(field);
    return;
  }
  *row += '"';
  for (const char c : field) row->append(c == '"' ? 2 : 1, c);
  *row += '"';
}

std::string ThreeDecimals(double number) { return fmt::format("{:.3f}", number); }

}  // namespace tools
