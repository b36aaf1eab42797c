// Reads a file under tests/cases line by line. Tests name a failing case by its file and line.
#ifndef TESTS_CASE_FILE_H
#define TESTS_CASE_FILE_H

#include <gtest/gtest.h>

#include <cstdint>
#include <fstream>
#include <sstream>
#include <string>

// Reads a number in C's notation, such as 12 or 0x1F. The test fails when the text is anything
// else.
inline uint64_t Number(const std::string &text) {
  size_t end = 0;
  const uint64_t number = std::stoull(text, &end, 0);  // throws where no number begins
  EXPECT_EQ(end, text.size()) << text;
  return number;
}

class CaseFile {
 public:
  // CASES is the folder tests/cases; CMake defines it.
  explicit CaseFile(const std::string &name) : name_(name), file_(CASES "/" + name) {
    EXPECT_TRUE(file_) << name;
  }

  // The next line that is neither empty nor a comment.
  bool Next(std::string *line) {
    do {
      if (!NextRaw(line)) return false;
    } while (line->empty() || line->starts_with('#'));
    return true;
  }

  // The next line, whatever it is.
  bool NextRaw(std::string *line) {
    ++number_;
    return static_cast<bool>(std::getline(file_, *line));
  }

  // The first character of the next line; NUL at the end of the file.
  char Peek() { return file_.peek() == EOF ? '\0' : static_cast<char>(file_.peek()); }

  // File and number of the line that was read last.
  std::string where() const { return name_ + ":" + std::to_string(number_); }

 private:
  std::string name_;
  std::ifstream file_;
  int number_ = 0;
};

// Calls the body with the columns of each line that is neither empty nor a comment; numbers in them
// may be hexadecimal.
template <typename Body>
void ForEachCase(const std::string &file, Body body) {
  CaseFile cases(file);
  for (std::string line; cases.Next(&line);) {
    SCOPED_TRACE(cases.where());
    std::istringstream columns(line);
    columns.unsetf(std::ios::dec);  // the prefix then decides: 0x is hexadecimal, 0 octal
    body(columns);
  }
}

#endif
