// Texts and numbers that come from outside.

#include "tools/text.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <cstdio>

namespace tools {
namespace {

// The length of the UTF-8 sequence that begins the text, or 0 when there is none; `code` is the
// character it stands for.
size_t TakeCharacter(std::string_view text, uint32_t *code) {
  // The least character by length; for those below there are shorter sequences.
  constexpr uint32_t kLeast[] = {0, 0, 0x80, 0x800, 0x10000};
  const auto byte = [&](size_t i) { return static_cast<unsigned char>(text[i]); };
  const size_t length = byte(0) < 0x80 ? 1 : byte(0) < 0xe0 ? 2 : byte(0) < 0xf0 ? 3 : 4;
  if (text.size() < length || (byte(0) >= 0x80 && byte(0) < 0xc0) || byte(0) >= 0xf8) return 0;
  *code = length == 1 ? byte(0) : byte(0) & (0x7fU >> length);
  for (size_t i = 1; i < length; ++i) {
    if ((byte(i) & 0xc0) != 0x80) return 0;
    *code = *code << 6 | (byte(i) & 0x3f);
  }
  const bool surrogate = *code >= 0xd800 && *code < 0xe000;
  return *code < kLeast[length] || *code > 0x10ffff || surrogate ? 0 : length;
}

bool IsControl(uint32_t code) { return code < 0x20 || (code >= 0x7f && code < 0xa0); }
bool IsAnything(uint32_t) { return true; }
bool IsPrinted(uint32_t code) { return !IsControl(code); }
bool IsPrintedOrLineEnd(uint32_t code) { return !IsControl(code) || code == '\n'; }

// Copies the characters that are wanted; the others, and what is no character, are replaced.
std::string Clean(std::string_view text, bool (*isWanted)(uint32_t code),
                  std::string_view replacement) {
  std::string clean;
  while (!text.empty()) {
    uint32_t code = 0;
    const size_t length = TakeCharacter(text, &code);
    const bool good = length > 0 && isWanted(code);
    clean += good ? text.substr(0, length) : replacement;
    text.remove_prefix(std::max<size_t>(length, 1));
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

bool IsValidText(std::string_view text) {
  while (!text.empty()) {
    uint32_t code = 0;
    const size_t length = TakeCharacter(text, &code);
    if (length == 0) return false;
    text.remove_prefix(length);
  }
  return true;
}

std::string ValidText(std::string_view text) { return Clean(text, IsAnything, "\xef\xbf\xbd"); }

std::optional<uint64_t> ParseNumber(std::string_view text, uint64_t most) {
  uint64_t number = 0;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  if (error != std::errc() || end != text.data() + text.size() || number > most) {
    return std::nullopt;
  }
  return number;
}

std::optional<double> ParseSeconds(std::string_view text) {
  constexpr double kMost = 1e9;
  double seconds = 0;
  const auto [end, error] =
      std::from_chars(text.data(), text.data() + text.size(), seconds, std::chars_format::fixed);
  const bool whole = error == std::errc() && end == text.data() + text.size();
  if (!whole || !(seconds >= 0 && seconds <= kMost) || std::signbit(seconds)) return std::nullopt;
  return seconds;
}

std::string ThreeDecimals(double number) {
  std::array<char, 400> text;  // the largest doubles have 309 digits
  std::snprintf(text.data(), text.size(), "%.3f", number);
  return text.data();
}

}  // namespace tools
