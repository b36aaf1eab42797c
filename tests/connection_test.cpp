// Discovery and connections against a scripted platform: calls, messages and handles.

#include "morwick/connection.h"

#include "tests/fake_platform.h"

namespace {

const std::string kFirst = "VeltoQRN3NVMeController";
const std::string kSecond = "VeltoEmbeddedNVMeController";
const std::string kThird = "KVRStorage";

// What one way in did: its result, the row it chose (3: the terminating row), its messages.
struct Outcome {
  bool good;
  long row;
  std::string out;
  std::string err;
  std::string journal;
};

// Each way in obtains what it obtains and gives it back.
enum WayIn { kFind, kFindNew, kConnect, kOpen };

Outcome Use(WayIn way) {
  NandExporter *row = nullptr;
  KVRConnection record = {77, 78, nullptr};
  bool good = false;
  testing::internal::CaptureStdout();
  testing::internal::CaptureStderr();
  switch (way) {
    case kFind:
      if (const uint32_t service = findNandExporter(&row)) good = ReleaseObject(service) == 0;
      break;
    case kFindNew:
      good = findNandExporterNew(&row) == 1;
      EXPECT_EQ(row->service != 0 && row->connection != 0, good);
      ReleaseIOInterfaces(row);
      break;
    case kConnect:
      if (const uint32_t connection = TolkConnect(&row)) {
        good = true;
        TolkDisconnect(connection);
      }
      break;
    case kOpen:
      good = openKVRConnection(&record) == 1;
      row = record.exporter;
      EXPECT_EQ(record.service != 0, good);
      EXPECT_EQ(record.connection != 0, good);
      closeKVRConnection(&record);
      EXPECT_EQ(record.service + record.connection, 0U);
      closeKVRConnection(&record);
      EXPECT_EQ(record.exporter, row);
      break;
  }
  const std::string out = testing::internal::GetCapturedStdout();
  for (NandExporter &exporter : nand_exporters) {
    exporter.service = 0;
    exporter.connection = 0;
  }
  return {good, row - nand_exporters, out, testing::internal::GetCapturedStderr(),
          fakePlatform.journal};
}

class ConnectionTest : public PlatformTest {};

TEST_F(ConnectionTest, EachWayInFindsOpensAndGivesBack) {
  const std::string match1 = "match " + kFirst + "\n";
  const std::string match2 = "match " + kSecond + "\n";
  const std::string match3 = "match " + kThird + "\n";
  const std::string none = "look up = 0\n";
  const std::string found = "Morwick: findNandExporter: Controller found: ";
  const std::string foundNew = "Morwick_drel: findNandExporterNew: Controller found: ";
  const struct {
    WayIn way;
    std::set<std::string> present;
    std::set<std::string> failing;
    Outcome expected;
  } cases[] = {
      {kFind, {}, {}, {false, 3, "", "", match1 + none + match2 + none + match3 + none}},
      {kFind,
       {kThird},
       {},
       {true, 2, found + kThird + "\n", "",
        match1 + none + match2 + none + match3 + "look up = 1\nrelease 1\n"}},
      {kFind,
       {kFirst, kSecond},
       {"match#1"},
       {true, 1, found + kSecond + "\n", "", match1 + match2 + "look up = 1\nrelease 1\n"}},
      {kFindNew, {}, {}, {false, 3, "", "", match1 + none + match2 + none + match3 + none}},
      {kFindNew,
       {kFirst, kSecond},
       {"open#1"},
       {true, 1, foundNew + kSecond + "\n", "",
        match1 + "look up = 1\nopen 1 type 0 = 0\nclose 0\nrelease 1\n" + match2 +
            "look up = 2\nopen 2 type 0 = 3\nclose 3\nrelease 2\n"}},
      {kConnect,
       {},
       {},
       {false, 3, "", "No class found", match1 + none + match2 + none + match3 + none}},
      {kConnect,
       {kFirst},
       {"open#1"},
       {false, 0, found + kFirst + "\n",
        "OpenService failed for class '" + kFirst + "', result 0x2c7\n",
        match1 + "look up = 1\nopen 1 type 0 = 0\nrelease 1\n"}},
      {kConnect,
       {kFirst},
       {"close#1"},
       {true, 0, found + kFirst + "\n", "closing connection to service failed\n",
        match1 + "look up = 1\nopen 1 type 0 = 2\nrelease 1\nclose 2\n"}},
      {kOpen,
       {},
       {},
       {false, 3, "", "Can't get KVR Connection, no matching service!\n",
        match1 + none + match2 + none + match3 + none}},
      {kOpen,
       {kFirst},
       {},
       {true, 0, found + kFirst + "\n" + found + kFirst + "\n", "",
        match1 + "look up = 1\n" + match1 +
            "look up = 2\nopen 2 type 0 = 3\nrelease 2\nclose 3\nrelease 1\n"}},
      {kOpen,
       {kFirst},
       {"look up#2"},
       {false, 3, found + kFirst + "\n", "No class foundCan't get KVR Connection!\n",
        match1 + "look up = 1\n" + match1 + none + match2 + none + match3 + none + "release 1\n"}},
      {kOpen,
       {kFirst},
       {"open#1"},
       {false, 0, found + kFirst + "\n" + found + kFirst + "\n",
        "OpenService failed for class '" + kFirst + "', result 0x2c7\nCan't get KVR Connection!\n",
        match1 + "look up = 1\n" + match1 +
            "look up = 2\nopen 2 type 0 = 0\nrelease 2\nrelease 1\n"}},
  };
  for (const auto &[way, present, failing, expected] : cases) {
    SCOPED_TRACE(testing::Message() << "case " << &expected - &cases[0].expected);
    fakePlatform = FakePlatform();
    fakePlatform.present = present;
    fakePlatform.failing = failing;
    const Outcome outcome = Use(way);
    EXPECT_EQ(outcome.good, expected.good);
    EXPECT_EQ(outcome.row, expected.row);
    EXPECT_EQ(outcome.out, expected.out);
    EXPECT_EQ(outcome.err, expected.err);
    EXPECT_EQ(outcome.journal, expected.journal);
    TearDown();
  }
}

// Any call failing, and any two: whatever was obtained is given back once.
TEST_F(ConnectionTest, GivesBackWhatItObtainedWhateverFails) {
  for (const WayIn way : {kFind, kFindNew, kConnect, kOpen}) {
    for (int first = 0; first <= 16; ++first) {
      for (int second = first; second <= 16; ++second) {
        fakePlatform = FakePlatform();
        fakePlatform.present = {kFirst, kThird};
        fakePlatform.failing = {"#" + std::to_string(first), "#" + std::to_string(second)};
        const Outcome outcome = Use(way);
        EXPECT_TRUE(outcome.row >= 0 && outcome.row <= 3);
        EXPECT_TRUE(outcome.good || !outcome.err.empty() || way == kFind || way == kFindNew);
        TearDown();
      }
    }
  }
}

TEST_F(ConnectionTest, RefusesARowWithAnotherStatisticsGetter) {
  fakePlatform.present = {kFirst};
  nand_exporters[0].getStatsSelectors = KVRGetSnapshotSelectors;
  const Outcome outcome = Use(kOpen);
  nand_exporters[0].getStatsSelectors = KVRGetStatsSelectors;
  EXPECT_FALSE(outcome.good);
  EXPECT_EQ(outcome.err, "Can't get KVR Connection!\n");
}

TEST_F(ConnectionTest, PassesOverNullPointers) {
  EXPECT_EQ(findNandExporter(nullptr), 0U);
  EXPECT_EQ(findNandExporterNew(nullptr), 0);
  EXPECT_EQ(TolkConnect(nullptr), 0U);
  EXPECT_EQ(openKVRConnection(nullptr), 0);
  ReleaseIOInterfaces(nullptr);
  closeKVRConnection(nullptr);
  EXPECT_EQ(fakePlatform.journal, "");
}

}  // namespace
