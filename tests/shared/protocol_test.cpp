// SPDX-License-Identifier: MIT
// The reader of the output recognises the program's lines and no others.
#include <gmock/gmock.h>

#include "tests/shared/protocol.h"

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

namespace {

using Kind = ProtocolLine::Kind;

TEST(ReadLine, RecognisesTheLinesOfTheProgram) {
  EXPECT_EQ(readLine("total, 51").kind, Kind::kTotal);
  EXPECT_EQ(readLine("total, 51").number, 51);
  EXPECT_EQ(readLine("14, initialize").kind, Kind::kStep);
  EXPECT_EQ(readLine("14, initialize").number, 14);
  EXPECT_EQ(readLine("14, initialize").text, "initialize");
  EXPECT_EQ(readLine("!gather info failed -1").kind, Kind::kFailure);
  EXPECT_EQ(readLine("!gather info failed -1").text, "gather info failed -1");
  EXPECT_EQ(readLine("unexpected exit").kind, Kind::kUnexpectedExit);
}

TEST(ReadLine, LeavesEverythingElseToThePlugin) {
  for (const char* line : {"", "total, ", "total, x", "x, y", ", y", "1,y", "-1, y", "unexpected exit ",
                           "1 dispatch 51, 0", "99999999999, y"}) {
    EXPECT_EQ(readLine(line).kind, Kind::kOther) << line;
  }
}

TEST(Sections, HoldThePluginsLinesThatFollowALineOfTheProgram) {
  const std::vector<Section> all = sections("loading\ntotal, 64\n1, first\none\ntwo\n!first failed 5\nbye");
  ASSERT_THAT(all, SizeIs(4));
  EXPECT_THAT(all[0].pluginLines, ElementsAre("loading"));
  EXPECT_EQ(all[1].line.whole, "total, 64");
  EXPECT_THAT(all[1].pluginLines, IsEmpty());
  EXPECT_EQ(all[2].line.whole, "1, first");
  EXPECT_THAT(all[2].pluginLines, ElementsAre("one", "two"));
  EXPECT_THAT(all[3].pluginLines, ElementsAre("bye"));
}

TEST(IsDrawnStep, TakesFiveTextsUnderTheRightNumber) {
  for (const char* text : {"inspect class info", "inspect preset info", "inspect parameter info",
                           "testing setting states", "inspect latency"}) {
    EXPECT_TRUE(isDrawnStep("16, " + std::string(text), 16));
  }
  for (const char* line :
       {"16, inspect stream format", "17, inspect latency", "16, inspect latency ", "16, initialize"}) {
    EXPECT_FALSE(isDrawnStep(line, 16)) << line;
  }
}

}  // namespace
