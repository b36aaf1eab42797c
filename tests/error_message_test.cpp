// The error message is the first one of the process, complete, from any thread.

#include "morwick/error_message.h"

#include <barrier>
#include <set>
#include <thread>

#include "tests/unit_test.h"

namespace {

TEST(ErrorMessageTest, KeepsTheFirstWholeMessage) {
  const char *none = nullptr;
  SetAPIErrorMessage(none, 7);
  SetAPIErrorMessage("%s %d", "100%d", 7);
  SetAPIErrorMessage("second");
  SetAPIErrorMessage(none, 7);
  EXPECT_EQ(TakeMessage(), "100%d 7");
  const wchar_t noCharacter[] = {0xd800, 0};
  SetAPIErrorMessage("what came before %ls is there", noCharacter);
  EXPECT_EQ(TakeMessage(), "what came before ");
  for (const size_t length : {0U, 1022U, 1023U, 1024U, 5000U}) {
    SetAPIErrorMessage("%s", std::string(length, 'x').c_str());
    SetAPIErrorMessage("an empty message is one, too");
    EXPECT_EQ(TakeMessage(), std::string(std::min<size_t>(length, 1023), 'x'));
  }
}

TEST(ErrorMessageTest, IsOneOfThoseThatEightThreadsReportAtOnce) {
  for (int round = 0; round < 50; ++round) {
    std::barrier start(8);
    std::vector<std::jthread> threads;
    std::set<std::string> possible;
    const char *seen[8] = {};  // by each thread, once it has reported
    for (int i = 0; i < 8; ++i) {
      const std::string length = std::to_string(i < 3 ? i + 1 : i + 11);  // ten is the good length
      possible.insert("KVRFTLParseBufferToCxt: hostWriteLogHisto(14): (#10) cfg elements != (" +
                      length + ") buffer elements");
      threads.emplace_back([&start, seenHere = &seen[i], length] {
        const std::string bytes = Stream(kFTL, "14:" + length + " 1.." + length);
        Contexts contexts = {};
        start.arrive_and_wait();
        ParseInto(&contexts, kFTL, bytes.data(), bytes.size());
        *seenHere = GetAPIErrorMessage();
        ReleaseGenericParserCxt(&contexts.generic);
      });
    }
    threads.clear();
    for (const char *message : seen) EXPECT_EQ(message, GetAPIErrorMessage());
    EXPECT_TRUE(possible.contains(TakeMessage()));
  }
}

}  // namespace
