// Discovery and connections against a scripted platform: calls, messages and handles.

#include "morwick/connection.h"

#include <algorithm>

#include "tests/cases.h"
#include "tests/fake_platform.h"

namespace {

// Goes in by one of the four ways and gives back what it obtained. All that could be seen of it.
std::string Use(const std::string &way) {
  NandExporter *row = nullptr;
  KVRConnection record = {77, 78, nullptr};
  bool good = false;
  testing::internal::CaptureStdout();
  testing::internal::CaptureStderr();
  if (way == "find") {
    if (const uint32_t service = findNandExporter(&row)) good = ReleaseObject(service) == 0;
  } else if (way == "find new") {
    good = findNandExporterNew(&row) == 1;
    EXPECT_EQ(row->service != 0 && row->connection != 0, good);
    ReleaseIOInterfaces(row);
  } else if (way == "connect") {
    const uint32_t connection = TolkConnect(&row);
    good = connection != 0;
    if (good) TolkDisconnect(connection);
  } else {
    good = openKVRConnection(&record) == 1;
    row = record.exporter;
    EXPECT_TRUE((record.service != 0) == good && (record.connection != 0) == good);
    for (int time = 0; time < 2; ++time) closeKVRConnection(&record);
    EXPECT_TRUE(record.service == 0 && record.connection == 0 && record.exporter == row);
  }
  for (NandExporter &exporter : nand_exporters) {
    exporter.service = 0;
    exporter.connection = 0;
  }
  const std::string out = testing::internal::GetCapturedStdout();
  return (good ? "good, row " : "failed, row ") + std::to_string(row - nand_exporters) + "\n" +
         fakePlatform.journal + out + testing::internal::GetCapturedStderr();
}

class ConnectionTest : public PlatformTest {};

TEST_F(ConnectionTest, EachWayInFindsOpensAndGivesBack) {
  for (const Case &use : ReadCases("connection.txt")) {
    SCOPED_TRACE(use.name);
    fakePlatform.Reset(use.given);
    NandExporter &row = nand_exporters[0];
    if (use.given.contains("other getter")) row.getStatsSelectors = KVRGetSnapshotSelectors;
    std::string seen = Use(use.given.at("way"));
    row.getStatsSelectors = KVRGetStatsSelectors;
    if (!seen.ends_with('\n')) seen += " (no line end)\n";
    EXPECT_EQ(seen, use.expected);
    TearDown();
  }
}

// Any call failing, and any two: whatever was obtained is given back once.
TEST_F(ConnectionTest, GivesBackWhatItObtainedWhateverFails) {
  for (const std::string way : {"find", "find new", "connect", "open"}) {
    for (int first = 0; first <= 16; ++first) {
      for (int second = first; second <= 16; ++second) {
        fakePlatform.Reset(
            {{"present", "VeltoQRN3NVMeController KVRStorage"},
             {"failing", "#" + std::to_string(first) + " #" + std::to_string(second)}});
        EXPECT_NE(Use(way), "");
        TearDown();
      }
    }
  }
}

TEST_F(ConnectionTest, PassesOverNullPointers) {
  EXPECT_EQ(findNandExporter(nullptr) + TolkConnect(nullptr), 0U);
  EXPECT_EQ(findNandExporterNew(nullptr) + openKVRConnection(nullptr), 0);
  ReleaseIOInterfaces(nullptr);
  closeKVRConnection(nullptr);
  EXPECT_EQ(fakePlatform.journal, "");
}

}  // namespace
