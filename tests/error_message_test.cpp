// The error message is the first one of the process, complete, from any thread.

#include "morwick/error_message.h"

#include <gtest/gtest.h>

#include <barrier>
#include <set>
#include <thread>
#include <vector>

#include "tests/heap.h"
#include "tests/stream_notation.h"

namespace {

TEST(ErrorMessageTest, KeepsTheFirstWholeMessage) {
  RefuseAllocation(1);
  SetAPIErrorMessage("no memory");
  RefuseAllocation(0);
  const char *none = nullptr;
  SetAPIErrorMessage(none, 7);
  EXPECT_EQ(TakeMessage(), "NA");
  SetAPIErrorMessage("%s %d", "100%d", 7);
  SetAPIErrorMessage("second");
  EXPECT_EQ(TakeMessage(), "100%d 7");
  SetAPIErrorMessage("kept");
  SetAPIErrorMessage(none, 7);
  EXPECT_EQ(TakeMessage(), "kept");
  const wchar_t noCharacter[] = {0xd800, 0};
  SetAPIErrorMessage("what came before %ls is there", noCharacter);
  EXPECT_EQ(TakeMessage(), "what came before ");
  const char *empty = "";
  SetAPIErrorMessage(empty, 7);
  SetAPIErrorMessage("an empty message is one, too");
  EXPECT_EQ(TakeMessage(), "");
  for (const size_t length : {1022U, 1023U, 1024U, 5000U}) {
    SetAPIErrorMessage("%s", std::string(length, 'x').c_str());
    EXPECT_EQ(TakeMessage().size(), length < 1023 ? length : 1023U);
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
