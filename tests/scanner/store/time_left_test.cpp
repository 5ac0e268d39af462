// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "scanner/plan/time_left.h"

using scanner::TimeLeft;

namespace {

TEST(TimeLeft, KnownDurationsAreSharedAmongTheJobs) {
  TimeLeft left;
  left.expect(10);
  left.expect(30);
  EXPECT_DOUBLE_EQ(left.seconds(1), 40);
  EXPECT_DOUBLE_EQ(left.seconds(4), 10);
}

TEST(TimeLeft, NothingIsSaidWhileNothingIsKnown) {
  TimeLeft left;
  left.expect(0);
  EXPECT_EQ(left.seconds(1), 0);
}

TEST(TimeLeft, AnUnknownRunCountsAsTheAverageOfThoseThatAreOver) {
  TimeLeft left;
  for (int i = 0; i < 5; ++i) left.expect(0);
  left.ended(0, 2);
  left.ended(0, 4);
  EXPECT_DOUBLE_EQ(left.seconds(1), 9);
}

TEST(TimeLeft, BeforeAnyIsOverAnUnknownRunCountsAsTheAverageOfTheKnown) {
  TimeLeft left;
  left.expect(2);
  left.expect(4);
  left.expect(0);
  EXPECT_DOUBLE_EQ(left.seconds(1), 9);
}

TEST(TimeLeft, AMachineThatIsSlowerTodayStretchesWhatIsLeft) {
  TimeLeft left;
  left.expect(10);
  left.expect(10);
  left.ended(10, 30);
  EXPECT_DOUBLE_EQ(left.seconds(1), 30);
  left.ended(10, 30);
  EXPECT_EQ(left.seconds(1), 0);
}

}  // namespace
