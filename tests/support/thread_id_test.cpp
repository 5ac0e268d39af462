// SPDX-License-Identifier: MIT
// Identities of threads.
#include <thread>

#include "gtest/gtest.h"
#include "support/thread_id.h"

namespace {

TEST(NiduThreadID, TwoNullValuesAreEqual) {
  const NiduThreadID one;
  const NiduThreadID other;
  EXPECT_TRUE(one.IsEqual(other));
}

TEST(NiduThreadID, ANullAndANonNullValueAreNotEqual) {
  const NiduThreadID null;
  const NiduThreadID current = NiduThreadID::CurrentThread();
  EXPECT_FALSE(null.IsEqual(current));
  EXPECT_FALSE(current.IsEqual(null));
}

TEST(NiduThreadID, AThreadIsEqualToItself) {
  EXPECT_TRUE(NiduThreadID::CurrentThread().IsEqual(NiduThreadID::CurrentThread()));
}

TEST(NiduThreadID, TwoThreadsThatBothLiveAreNotEqual) {
  const NiduThreadID mine = NiduThreadID::CurrentThread();
  std::thread([&] {
    EXPECT_FALSE(mine.IsEqual(NiduThreadID::CurrentThread()));
    EXPECT_FALSE(NiduThreadID::CurrentThread().IsEqual(mine));
  }).join();
}

TEST(NiduThreadID, AssignmentAndCopyTakeTheValueOver) {
  NiduThreadID value;
  value = NiduThreadID::CurrentThread();
  EXPECT_TRUE(value.IsEqual(NiduThreadID::CurrentThread()));
  const NiduThreadID copy(value);
  value = NiduThreadID();
  EXPECT_TRUE(value.IsEqual(NiduThreadID()));
  EXPECT_TRUE(copy.IsEqual(NiduThreadID::CurrentThread()));
}

}  // namespace
