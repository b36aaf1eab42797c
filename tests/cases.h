// Cases kept in text files under tests/cases: what is given, as "key: value" lines, and behind a
// line
// "->" the text that is to come of it. A line that starts with "== " names a case and begins it.
#ifndef TESTS_CASES_H
#define TESTS_CASES_H

#include <gtest/gtest.h>

#include <fstream>
#include <map>
#include <string>
#include <vector>

struct Case {
  std::string name;
  std::map<std::string, std::string> given;
  std::string expected;
};

inline std::vector<Case> ReadCases(const std::string &file) {
  std::vector<Case> cases;
  bool given = true;
  std::ifstream stream(CASES "/" + file);
  for (std::string line; std::getline(stream, line);) {
    if (line.starts_with("== ")) {
      cases.push_back({line.substr(3), {}, ""});
      given = true;
    } else if (given && line == "->") {
      given = false;
    } else if (given && line.find(": ") != std::string::npos) {
      cases.back().given[line.substr(0, line.find(": "))] = line.substr(line.find(": ") + 2);
    } else if (!given) {
      cases.back().expected += line + "\n";
    }
  }
  EXPECT_FALSE(cases.empty()) << file;
  return cases;
}

#endif
