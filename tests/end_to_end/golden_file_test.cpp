// SPDX-License-Identifier: MIT
// The comparison with golden files reports each kind of difference.
#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"

using testing::ElementsAre;

namespace {

/// A run with drawn steps from 16 to `last`, whose end is a line of its own.
std::vector<std::string> runWithDrawnSteps(int last) {
  std::vector<std::string> steps = {"15, test gathering info"};
  for (int number = 16; number <= last; ++number) {
    steps.push_back(std::to_string(number) + ", inspect latency");
  }
  steps.emplace_back("exit status 0");
  return steps;
}

TEST(FoldRandomPass, MakesOneLineOfFifty) {
  EXPECT_THAT(foldRandomPass(runWithDrawnSteps(65)),
              ElementsAre("15, test gathering info", "16 to 65, tests drawn at random", "exit status 0"));
  EXPECT_EQ(foldRandomPass(runWithDrawnSteps(66)).at(2), "66, inspect latency");
}

TEST(FoldRandomPass, LeavesAWrongPassAsItIs) {
  EXPECT_EQ(foldRandomPass(runWithDrawnSteps(64)), runWithDrawnSteps(64));
  std::vector<std::string> steps = runWithDrawnSteps(65);
  steps.at(4) = "19, inspect stream format";  // Never drawn.
  EXPECT_EQ(foldRandomPass(steps), steps);
}

TEST(FirstDifference, NamesTheLine) {
  EXPECT_EQ(firstDifference({"a", "b"}, {"a", "b"}), "");
  EXPECT_EQ(firstDifference({"a", "b"}, {"a", "c"}), "line 2 is \"c\", expected \"b\"");
  EXPECT_EQ(firstDifference({"a", "b"}, {"a"}), "line 2 is the end, expected \"b\"");
  EXPECT_EQ(firstDifference({"a"}, {"a", "b"}), "line 2 is \"b\", expected the end");
}

TEST(MatchesGolden, FailsWithoutAFile) {
  if (goldenIsToBeUpdated()) GTEST_SKIP() << "would write the file";
  EXPECT_FALSE(matchesGolden("no_such_file", {"a"}));
}

}  // namespace
