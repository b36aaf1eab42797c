// Discovery and connections against a scripted platform: calls, messages and handles.

#include "morwick/connection.h"

#include <gtest/gtest.h>

#include <iostream>

#include "morwick/platform.h"
#include "tests/fake_platform.h"

namespace {

// Finds or connects in one of four ways, gives back the handles and prints the outcome. `held` is
// the connection that the record holds before it is opened.
void Use(const std::string &way, uint32_t held = 0) {
  NandExporter *row = &nand_exporters[2];  // no search begins here
  KVRConnection record = {77, held, row};  // opening must overwrite the 77
  bool good = false;
  if (way == "find") {
    if (const uint32_t service = findNandExporter(&row)) good = ReleaseObject(service) == 0;
  } else if (way == "find new") {
    good = findNandExporterNew(&row) == 1;
    EXPECT_EQ(row->service != 0, good);
    const NandExporter before = *row;
    ReleaseIOInterfaces(row);
    EXPECT_TRUE(row->service == before.service && row->connection == before.connection);
  } else if (way == "connect") {
    const uint32_t connection = TolkConnect(&row);
    good = connection != 0;
    if (good) TolkDisconnect(connection);
  } else if (way == "open") {
    good = openKVRConnection(&record) == 1;
    row = record.exporter;
    EXPECT_TRUE((record.service != 0) == good && (record.connection != 0) == good);
    for (int time = 0; time < 2; ++time) closeKVRConnection(&record);
    EXPECT_TRUE(record.service == 0 && record.connection == 0 && record.exporter == row);
  } else {
    FAIL() << "there is no way '" << way << "'";
  }
  for (NandExporter *each = nand_exporters; each->className != nullptr; ++each) {
    each->service = each->connection = 0;
  }
  std::cout << (good ? "good, " : "failed, ");
  if (row->className == nullptr) {
    std::cout << "no row\n";
  } else {
    std::cout << "row " << row->className << "\n";
  }
}

TEST(ConnectionTest, EachWayInFindsOpensAndGivesBack) {
  PlayCases("connection.txt", [](Script &script) {
    SelectorGetter &slot = nand_exporters[0].getStatsSelectors;
    if (script.contains("other getter")) slot = KVRGetSnapshotSelectors;
    NandExporter *row = nullptr;
    Use(script["way"], script.contains("held") ? TolkConnect(&row) : 0);
    slot = KVRGetStatsSelectors;
  });
}

// Other functions do not use the handles that findNandExporterNew keeps in the row.
TEST(ConnectionTest, SearchesAnewEachTime) {
  const std::string outcome = Play({{"present", "KVRStorage"}}, [] {
    NandExporter *kept = nullptr;
    NandExporter *found = nullptr;
    findNandExporterNew(&kept);
    ReleaseObject(findNandExporter(&found));
    EXPECT_EQ(found, kept);
    ReleaseIOInterfaces(kept);
    kept->connection = kept->service = 0;
  });
  EXPECT_TRUE(outcome.ends_with("search\nfind KVRStorage = 3\nrelease 3\nclose 2\nrelease 1\n"))
      << outcome;
}

TEST(ConnectionTest, GivesBackWhatItObtainedWhateverFails) {
  for (const char *way : {"find", "find new", "connect", "open"}) {
    PlayEveryFailure({{"present", "VeltoQRN3NVMeController KVRStorage"}}, [&] { Use(way); });
  }
}

TEST(ConnectionTest, DisconnectsWhateverItIsGiven) {
  EXPECT_EQ(Play({}, [] { TolkDisconnect(0); }),
            "closing connection to service failed\n\nclose 0\n");
}

TEST(ConnectionTest, PassesOverNullPointers) {
  const std::string outcome = Play({}, [] {
    EXPECT_EQ(findNandExporter(nullptr) + TolkConnect(nullptr), 0U);
    EXPECT_EQ(findNandExporterNew(nullptr) + openKVRConnection(nullptr), 0);
    ReleaseIOInterfaces(nullptr);
    closeKVRConnection(nullptr);
  });
  EXPECT_EQ(outcome, "");
}

}  // namespace
