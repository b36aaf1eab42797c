// What unit tests share: cases from files under tests/cases, which a failing test names by file and
// line, bytes that are never aligned, refused memory, and the headers that most tests use.
#ifndef TESTS_UNIT_TEST_H
#define TESTS_UNIT_TEST_H

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "tests/parsing.h"

// Reads a number in C's notation, such as 12 or 0x1F. The test fails when the text is anything
// else.
inline uint64_t Number(const std::string &text) {
  size_t end = 0;
  const uint64_t number = std::stoull(text, &end, 0);  // throws where no number begins
  EXPECT_EQ(end, text.size()) << text;
  return number;
}

// Calls the body with each case of a file under tests/cases; numbers in it may be hexadecimal. A
// case is a line that is neither empty nor a comment, or a line "== name" and all lines up to the
// next one.
template <typename Body>
void ForEachCase(const std::string &name, Body body) {
  std::ifstream file(CASES "/" + name);  // CMake defines the folder
  EXPECT_TRUE(file) << name;
  int number = 0;
  for (std::string text, line; ++number, std::getline(file, text);) {
    if (text.empty() || text.starts_with('#')) continue;
    SCOPED_TRACE(name + ":" + std::to_string(number));
    if (text[0] == '=') text += "\n";
    for (; text[0] == '=' && file.peek() != '=' && std::getline(file, line); ++number) {
      text += line + "\n";
    }
    std::istringstream columns(text);
    columns.unsetf(std::ios::dec);  // the prefix then decides: 0x is hexadecimal, 0 octal
    body(columns);
  }
}

inline Kind KindOf(const std::string &name) {
  constexpr std::string_view kKinds[] = {"KVR", "FTL", "MSP", "Array"};
  const auto *found = std::ranges::find(kKinds, name);
  EXPECT_NE(found, std::end(kKinds)) << "no such kind: " << name;
  return static_cast<Kind>(found - kKinds);
}

// A stream from its notation: "4:1" is a header with key and length, "7" a value, "3..5" the values
// 3, 4 and 5, "'ab" the bytes a and b. Headers and values are as wide as the kind's; an array is
// written in bytes.
inline std::string Stream(Kind kind, const std::string &notation) {
  std::string bytes;
  const size_t width = kind == kArray ? 1 : kind == kMSP ? 4 : 8;
  const auto put = [&](uint64_t number, size_t size) {
    for (size_t i = 0; i < size; ++i) bytes += static_cast<char>(number >> (8 * i));
  };
  std::istringstream tokens(notation);
  for (std::string token; tokens >> token;) {
    const size_t colon = token.find(':');
    const size_t dots = token.find("..");
    if (token[0] == '\'') {
      bytes += token.substr(1);
    } else if (colon != std::string::npos) {
      put(Number(token.substr(0, colon)), width / 2);
      put(Number(token.substr(colon + 1)), width / 2);
    } else {
      uint64_t value = Number(token.substr(0, dots));
      const uint64_t last = dots == std::string::npos ? value : Number(token.substr(dots + 2));
      do put(value, width);
      while (value++ != last);
    }
  }
  return bytes;
}

// The text before the next bar, without the blanks around it.
inline std::string TakeColumn(std::istringstream &columns) {
  std::string column;
  std::getline(columns, column, '|');
  const size_t first = std::min(column.find_first_not_of(' '), column.size());
  return column.substr(first, column.find_last_not_of(' ') + 1 - first);
}

// A copy of the bytes that begins at index 1, so that it is never aligned. It ends with the
// allocation, so that AddressSanitizer sees one byte too many.
inline std::vector<char> Unaligned(const std::string &bytes) {
  const std::string shifted = "x" + bytes;
  return {shifted.begin(), shifted.end()};
}

// Refuses the n-th allocation from now, counted from 1; 0 refuses none. Returns how many there were
// since the last call, those with new included. Tests of a platform do not have it.
extern "C" unsigned long RefuseAllocation(unsigned long number);

#endif
