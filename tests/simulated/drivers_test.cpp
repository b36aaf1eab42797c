// The simulated drivers: handles are checked, and only the right requests are answered.

#include <csignal>

#include "tests/simulated/platform.h"
#include "tests/unit_test.h"

namespace {

TEST(SimulatedDriversTest, AnswersTheRightRequestsOnly) {
  int fifo[2] = {};
  ASSERT_EQ(pipe(fifo), 0);
  ASSERT_EQ(write(fifo[1], "0123456789rest", 14), 14);
  Play(
      "[[controller]]\nclass = 'KVRStorage'\nvanish = [2]\npending = 3\nfail_request = [3]\n"
      "fail_read = [5]\nshort_read = [8, 19]\nmsp = '" +
      File("msp") + "'\nstatistics = ['" + File("first") + "', '/proc/self/fd/" + File("2nd") +
      "', '" + File("third") + "']\nsnapshot = ['" + File("") +
      "', '/']\ndefects = [\"/no ~\\n\\u007f\", '" + File("never") + "']\ntelemetry = '" +
      std::to_string(fifo[0]) + "'\n");
  const uint32_t connection = Connect();
  testing::internal::CaptureStderr();
  ForEachCase("requests.txt", [&](std::istringstream &columns) {
    uint32_t method, length, room, request[6] = {};
    std::string arrow, code, reply;
    columns >> method >> length >> room;
    for (uint32_t &word : request) {
      if ((columns >> std::ws).peek() != '-') columns >> word;
    }
    EXPECT_TRUE(columns >> arrow >> code && arrow == "->");
    const auto result = static_cast<int32_t>(Number(code));
    std::getline(columns >> std::ws, reply);
    if (reply.starts_with('=')) reply = {static_cast<char>(Number(reply.substr(1))), 0, 0, 0};
    std::string buffer(room + 1, '#');
    size_t size = room;
    close(STDIN_FILENO);  // a file that is read is descriptor 0 then
    EXPECT_EQ(CallStructMethod(connection, method, request, length, buffer.data(), &size), result);
    EXPECT_EQ(dup(STDOUT_FILENO), STDIN_FILENO) << "a descriptor is left open";
    EXPECT_EQ(buffer.substr(0, size), reply);
    // A call that fails writes nothing; one that cuts its reply short writes zeros after it.
    const std::string_view unwritten = result == 0 ? std::string_view("#\0", 2) : "#";
    EXPECT_EQ(buffer.find_first_not_of(unwritten, size), std::string::npos);
    EXPECT_EQ(buffer.back(), '#');
  });
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "platform_tests: '/': Is a directory\n"
            "platform_tests: '/no ~\\x0a\\x7f': No such file or directory\n"
            "platform_tests: '/no ~\\x0a\\x7f': No such file or directory\n");
  std::string rest(99, '\0');
  EXPECT_EQ(read(fifo[0], rest.data(), rest.size()), 4) << "what there was no room for";
  EXPECT_EQ(CloseService(connection), 0);
  EXPECT_EQ(Find(), 0U) << "the second look-up finds it gone";
}

// The library's table and the simulated drivers' own list know the same classes and methods.
TEST(SimulatedDriversTest, KnowsEachClassOfTheTable) {
  std::string scenario;
  for (const NandExporter *row = nand_exporters; row->className != nullptr; ++row)
    scenario += std::string("[[controller]]\nclass = '") + row->className + "'\n";
  Play(scenario);
  for (const NandExporter *row = nand_exporters; row->className != nullptr; ++row) {
    SCOPED_TRACE(row->className);
    const SelectorPair *pair = row->getSnapshotSelectors();
    MorwickBuffer buffer;
    EXPECT_EQ(MorwickReadBuffer(Connect(row->className), row, pair, &buffer), kMorwickRead);
    MorwickFreeBuffer(&buffer);
    for (const SelectorGetter get :
         {row->getStatsSelectors, row->getMSPStatsSelectors, row->getDefectsListSelectors,
          row->getTelemetryListSelectors, row->getTaskSchedulerSelectors, row->getSnapshotSelectors,
          row->getSnapshotHeaderSelectors, row->getBandStatsSelectors}) {
      EXPECT_TRUE(get == nullptr || get()->first == get()->second);
    }
  }
}

TEST(SimulatedDriversDeathTest, RefusesAndReportsBadHandles) {
  Play("[[controller]]\nclass = 'KVRStorage'\nrefuse_open = [2]\nfail_close = [2]\n");
  EXPECT_EQ(ServiceMatching(nullptr), nullptr);
  EXPECT_EQ(GetMatchingService(nullptr), 0U);
  const uint32_t service = Find();
  uint32_t connection = 0, second = 1;
  size_t size = 99;
  EXPECT_EQ(OpenService(service, 0, &connection), 0);
  EXPECT_EQ(OpenService(service, 0, &second), kRefused);
  EXPECT_EQ(second, 0U);
  EXPECT_EQ(OpenService(service, 0, &second), 0);
  testing::internal::CaptureStderr();
  EXPECT_EQ(CloseService(service), kBadHandle);
  EXPECT_EQ(ReleaseObject(second + 1), kBadHandle);
  EXPECT_EQ(CloseService(connection), 0);
  EXPECT_EQ(CloseService(second), kDeviceError);
  EXPECT_EQ(CloseService(second), kBadHandle);
  EXPECT_EQ(CallStructMethod(connection, 8, nullptr, 0, nullptr, &size), kBadHandle);
  EXPECT_EQ(size, 0U);
  EXPECT_EQ(OpenService(service, 0, &connection), 0);
  EXPECT_GT(connection, second) << "a number is used twice";
  EXPECT_EQ(CloseService(connection), 0);
  EXPECT_EQ(ReleaseObject(service), 0);
  EXPECT_EQ(OpenService(service, 0, &connection), kBadHandle);
  EXPECT_EQ(CloseService(0), kBadHandle);
  EXPECT_EQ(
      testing::internal::GetCapturedStderr(),
      "connection 1 is of another kind\nservice 4 is unknown\nconnection 3 is already released\n"
      "connection 2 is already released\nservice 1 is already released\n");
  EXPECT_EXIT(std::exit(Find() == 5 ? 0 : 1), kEndsWell, "service 5 of KVRStorage is still open");
}

TEST(SimulatedDriversDeathTest, LeavesSignalsToATool) {
  Play("[[controller]]\nclass = 'KVRStorage'\n");
  CloseService(Connect());
  for (const int signal : {SIGHUP, SIGINT, SIGTERM, SIGUSR1, SIGPIPE, SIGXFSZ}) {
    EXPECT_EXIT(std::raise(signal), testing::KilledBySignal(signal), "^$");
  }
}

TEST(SimulatedDriversTest, GivesBuffersToTheCaller) {
  Play("[[controller]]\nclass = 'VeltoQRN3NVMeController'\nsnapshot = '" + File("") + "'\n");
  const NandExporter *row = nand_exporters;
  const SelectorPair *pair = row->getSnapshotSelectors();
  const uint32_t connection = Connect(row->className);
  MorwickBuffer buffer;
  EXPECT_EQ(MorwickReadBuffer(connection, row, pair, nullptr), kMorwickReadFailed);
  EXPECT_EQ(MorwickReadBuffer(connection, nullptr, pair, &buffer), kMorwickReadFailed);
  EXPECT_EQ(MorwickReadBuffer(connection, row, nullptr, &buffer), kMorwickReadFailed);
  EXPECT_EQ(buffer.bytes, nullptr);
  EXPECT_EQ(MorwickReadBuffer(connection, row, pair, &buffer), kMorwickRead);
  EXPECT_TRUE(buffer.bytes != nullptr && buffer.size == 0);
  buffer.size = 77;
  buffer.result = kRefused;
  for (int time = 0; time < 2; ++time) MorwickFreeBuffer(&buffer);
  MorwickFreeBuffer(nullptr);
  EXPECT_TRUE(buffer.bytes == nullptr && buffer.size == 0 && buffer.result == 0);
  EXPECT_EQ(MorwickFindService(nullptr), 0U);
  EXPECT_EQ(CloseService(connection), 0);
}

}  // namespace
