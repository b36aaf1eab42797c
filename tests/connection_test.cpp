// Discovery and connections against a scripted platform: calls, messages and handles.

#include "morwick/connection.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <iostream>

#include "fleet/controllers.h"
#include "morwick/platform.h"
#include "tests/fake_platform.h"

namespace {

// Goes in the way that the case names, gives back the handles and prints the outcome. `held` is
// the connection that the record holds before it is opened.
void Use(const std::string &way, uint32_t held = 0) {
  NandExporter *row = &nand_exporters[2];  // no search begins here
  KVRConnection record = {77, held, row};  // opening must overwrite the 77
  bool good = false;
  if (way == "find") {
    if (const uint32_t service = findNandExporter(&row)) good = ReleaseObject(service) == 0;
  } else if (way.starts_with("find new")) {
    good = findNandExporterNew(&row) == 1;
    EXPECT_EQ(row->service != 0, good);
    if (way == "find new, then find") ReleaseObject(findNandExporter(&row));
    const NandExporter before = *row;
    ReleaseIOInterfaces(row);
    EXPECT_TRUE(row->service == before.service && row->connection == before.connection);
    row->service = row->connection = 0;
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
  } else if (way == "disconnect") {
    TolkDisconnect(held);
  } else if (way == "probe") {
    errno = ENOMEM;  // as an earlier call may leave it
    const fleet::Presence presence = fleet::Probe(*row);
    good = presence.opened;
    std::cout << (presence.present ? "present, " : "absent, ") << presence.result << ", ";
  } else if (way == "null") {
    good = findNandExporter(nullptr) + TolkConnect(nullptr) != 0 ||
           findNandExporterNew(nullptr) + openKVRConnection(nullptr) != 0;
    ReleaseIOInterfaces(nullptr);
    closeKVRConnection(nullptr);
  }
  const char *found = row->className == nullptr ? "none" : row->className;
  std::cout << (good ? "good, " : "failed, ") << "row " << found << "\n";
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

TEST(ConnectionTest, GivesBackWhatItObtainedWhateverFails) {
  for (const char *way : {"find", "find new", "connect", "open", "probe"}) {
    PlayEveryFailure({{"present", "VeltoQRN3NVMeController KVRStorage"}}, [&] { Use(way); });
  }
}

}  // namespace
