// SPDX-License-Identifier: MIT
// The semaphore, on the system's.
#include <type_traits>

#include <signal.h>

#include "gtest/gtest.h"
#include "support/semaphore.h"
#include "tests/shared/observed_thread.h"

namespace {

static_assert(!std::is_copy_constructible_v<NiduSemaphore>);
static_assert(!std::is_copy_assignable_v<NiduSemaphore>);

TEST(NiduSemaphore, CountsSignalsThatNobodyWaitsFor) {
  NiduSemaphore semaphore;
  EXPECT_EQ(semaphore.signal(), 0);
  EXPECT_EQ(semaphore.signal(), 0);
  EXPECT_EQ(semaphore.wait(), 0);
  EXPECT_EQ(semaphore.wait(), 0);
}

TEST(NiduSemaphore, StartsEmptySoThatAWaitSleepsUntilASignal) {
  NiduSemaphore semaphore;
  int result = -1;
  ObservedThread waiter([&] { result = semaphore.wait(); });
  EXPECT_TRUE(waiter.isSeenAsleep());
  EXPECT_EQ(semaphore.signal(), 0);
  waiter.join();
  EXPECT_EQ(result, 0);
}

TEST(NiduSemaphore, AWaitGoesOnAfterInterruptions) {
  installInterruptHandlers();
  NiduSemaphore semaphore;
  int result = -1;
  ObservedThread waiter([&] { result = semaphore.wait(); });
  for (int interruption = 0; interruption < 3; ++interruption) {
    ASSERT_TRUE(waiter.isSeenAsleep());
    waiter.interrupt(SIGUSR1);
  }
  EXPECT_TRUE(waiter.isSeenAsleep());
  EXPECT_EQ(semaphore.signal(), 0);
  waiter.join();
  EXPECT_EQ(result, 0);
}

}  // namespace
