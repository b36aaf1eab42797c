// Helpers for tests of the simulated platform. The platform has one scenario a process, so run the
// tests by ctest, which gives each a process of its own.
#ifndef TESTS_SIMULATED_PLATFORM_H
#define TESTS_SIMULATED_PLATFORM_H

#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cstdlib>
#include <string>

#include "morwick/platform.h"

// Result codes of the simulated drivers.
constexpr int32_t kBadHandle = 0x101;
constexpr int32_t kBadArgument = 0x102;
constexpr int32_t kRefused = static_cast<int32_t>(0xE0000103);
constexpr int32_t kDeviceError = static_cast<int32_t>(0xE0000104);

const testing::ExitedWithCode kEndsWell(0);

// Makes a file in memory, and returns its name in the folder of the scenario, /proc/self/fd.
inline std::string File(const std::string &text) {
  const int file = memfd_create("file", 0);
  EXPECT_EQ(write(file, text.data(), text.size()), static_cast<ssize_t>(text.size()));
  return std::to_string(file);
}

inline void Play(const std::string &scenario) {
  setenv("GRELLON_SCENARIO", ("/proc/self/fd/" + File(scenario)).c_str(), 1);
}

inline uint32_t Find(const char *className = "KVRStorage") {
  return GetMatchingService(ServiceMatching(className));
}

inline uint32_t Connect(const char *className = "KVRStorage") {
  const uint32_t service = Find(className);
  uint32_t connection = 1;
  EXPECT_EQ(OpenService(service, 1, &connection), kBadArgument);
  EXPECT_EQ(connection, 0U);
  EXPECT_EQ(OpenService(service, 0, &connection), 0);
  EXPECT_EQ(ReleaseObject(service), 0);
  return connection;
}

#endif
