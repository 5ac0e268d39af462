// SPDX-License-Identifier: MIT
// Identities of threads.
#include <thread>

#include "gtest/gtest.h"
#include "support/thread_id.h"

namespace {

TEST(NiduThreadID, NullEqualsOnlyNull) {
  const NiduThreadID null;
  const NiduThreadID current = NiduThreadID::CurrentThread();
  EXPECT_TRUE(null.IsEqual(NiduThreadID()));
  EXPECT_FALSE(null.IsEqual(current));
  EXPECT_FALSE(current.IsEqual(null));
}

TEST(NiduThreadID, AThreadEqualsItselfAndNoOtherThatLives) {
  const NiduThreadID mine = NiduThreadID::CurrentThread();
  EXPECT_TRUE(mine.IsEqual(NiduThreadID::CurrentThread()));
  std::thread([&] { EXPECT_FALSE(mine.IsEqual(NiduThreadID::CurrentThread())); }).join();
}

TEST(NiduThreadID, CopiesAndAssignmentsHaveTheValueOfTheOriginal) {
  NiduThreadID value;
  value = NiduThreadID::CurrentThread();
  const NiduThreadID copy(value);
  value = NiduThreadID();
  EXPECT_TRUE(value.IsEqual(NiduThreadID()));
  EXPECT_TRUE(copy.IsEqual(NiduThreadID::CurrentThread()));
}

}  // namespace
