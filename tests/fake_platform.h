// A platform for tests: it plays a script, keeps a journal of every call and counts handles.
#ifndef TESTS_FAKE_PLATFORM_H
#define TESTS_FAKE_PLATFORM_H

#include <gtest/gtest.h>

#include <deque>
#include <map>
#include <set>
#include <string>

#include "platform/platform.h"

struct FakePlatform {
  // The script. A list that has run out answers 0 or no.
  std::set<std::string> present;    // driver classes that are registered
  std::set<std::string> failing;    // calls that fail, as "name#n" or, counting all calls, "#n"
  std::deque<std::string> replies;  // what the controller answers requests with
  std::deque<std::string> defers;   // what the scheduler answers questions with: yes or no
  int activityState = kActivityStateRun;

  // What happened, a line a call.
  std::string journal;
  size_t calls = 0;  // of those that can fail
  std::map<std::string, size_t> callsByName;
  std::map<uint32_t, std::string> openHandles;
  size_t openRequests = 0;
  uint32_t lastHandle = 0;

  // Starts anew with a script: words by "present", "failing", "replies", "defers", "state".
  void Reset(const std::map<std::string, std::string> &script);
  void Write(const std::string &line) { journal += line + "\n"; }
  bool Fails(const std::string &name);
  uint32_t Issue(const std::string &what);
  void Return(uint32_t handle, const std::string &what);
};

extern FakePlatform fakePlatform;

// Starts every test from a fresh platform and fails the test that leaves a handle open.
class PlatformTest : public testing::Test {
 protected:
  PlatformTest() { fakePlatform = FakePlatform(); }
  void TearDown() override;
};

#endif
