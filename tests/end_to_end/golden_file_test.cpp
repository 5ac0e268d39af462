// SPDX-License-Identifier: MIT
// The comparison with golden files: what it takes, and what it must not let through.
#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace {

std::vector<std::string> drawnSteps(const std::string& text = "inspect latency") {
  std::vector<std::string> steps;
  for (int number = 16; number <= 65; ++number) steps.push_back(std::to_string(number) + ", " + text);
  return steps;
}

std::vector<std::string> runWith(std::vector<std::string> steps) {
  steps.insert(steps.begin(), "15, test gathering info");
  steps.emplace_back("exit status 0");
  return steps;
}

const std::vector<std::string> kGolden = {"15, test gathering info", "16 to 65, tests drawn at random",
                                          "exit status 0"};

TEST(FirstDifference, IsEmptyForEqualLines) {
  EXPECT_THAT(firstDifference({}, {}), IsEmpty());
  EXPECT_THAT(firstDifference({"total, 51", "exit status 1"}, {"total, 51", "exit status 1"}), IsEmpty());
}

TEST(FirstDifference, TakesAnyOfFiveTestsInTheRandomPass) {
  for (const char* text : {"inspect class info", "inspect preset info", "inspect parameter info",
                           "testing setting states", "inspect latency"}) {
    EXPECT_THAT(firstDifference(kGolden, runWith(drawnSteps(text))), IsEmpty());
  }
}

TEST(FirstDifference, TellsAnotherLine) {
  EXPECT_EQ(firstDifference({"a", "b"}, {"a", "c"}), "line 2 is \"c\", expected \"b\"");
  EXPECT_EQ(firstDifference({"a", "b"}, {"a"}), "line 2 is the end, expected \"b\"");
  EXPECT_EQ(firstDifference({"a"}, {"a", "b"}), "line 2 is \"b\", expected the end");
}

TEST(FirstDifference, TellsTheTestThatIsNeverDrawn) {
  auto steps = drawnSteps();
  steps[10] = "26, inspect stream format";
  EXPECT_THAT(firstDifference(kGolden, runWith(steps)),
              HasSubstr("line 12 is \"26, inspect stream format\""));
}

TEST(FirstDifference, TellsAWrongNumber) {
  auto steps = drawnSteps();
  steps[49] = "66, inspect latency";
  EXPECT_THAT(firstDifference(kGolden, runWith(steps)), HasSubstr("expected drawn test 65"));
}

TEST(FirstDifference, TellsAMissingAndASurplusDraw) {
  auto steps = drawnSteps();
  steps.emplace_back("66, inspect latency");
  EXPECT_EQ(firstDifference(kGolden, runWith(steps)),
            "line 52 is \"66, inspect latency\", expected \"exit status 0\"");
  steps.resize(49);
  EXPECT_EQ(firstDifference(kGolden, runWith(steps)), "line 51 is \"exit status 0\", expected drawn test 65");
}

TEST(FirstDifference, TellsAnotherText) {
  EXPECT_THAT(firstDifference(kGolden, runWith(drawnSteps("inspect latency "))), HasSubstr("line 2 is"));
}

TEST(FoldRandomPass, MakesOneLineOfFifty) {
  EXPECT_THAT(foldRandomPass(runWith(drawnSteps())),
              ElementsAre("15, test gathering info", "16 to 65, tests drawn at random", "exit status 0"));
}

TEST(FoldRandomPass, LeavesAWrongPassAsItIs) {
  auto steps = drawnSteps();
  steps[3] = "19, inspect stream format";
  EXPECT_EQ(foldRandomPass(runWith(steps)), runWith(steps));
  EXPECT_THAT(foldRandomPass({"total, 51"}), ElementsAre("total, 51"));
}

TEST(MatchesGolden, FailsWithoutAFile) {
  EXPECT_FALSE(firstDifference(goldenLines("no_such"), {"a"}).empty());
}

}  // namespace
