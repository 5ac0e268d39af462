// SPDX-License-Identifier: MIT
// The recursive lock between real threads.
#include <functional>
#include <memory>
#include <type_traits>
#include <vector>

#include <signal.h>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/atomic_add.h"
#include "support/recursive_mutex.h"
#include "tests/shared/observed_thread.h"
#include "tests/support/start_together.h"

namespace {

static_assert(!std::is_copy_constructible_v<NiduCoreRecursiveMutex>);
static_assert(!std::is_copy_assignable_v<NiduCoreRecursiveMutex>);

class NiduCoreRecursiveMutexTest : public testing::Test {
 protected:
  // The counter, read in a way that is safe while other threads lock.
  std::int32_t lockCount() { return AtomicAdd32Implementation(&mutex.lockCount, 0); }
  bool isOwnedByThisThread() const { return mutex.owner.IsEqual(NiduThreadID::CurrentThread()); }
  void expectFree() {
    EXPECT_EQ(lockCount(), 0);
    EXPECT_EQ(mutex.recursionDepth, 0);
    EXPECT_TRUE(mutex.owner.IsEqual(NiduThreadID()));
  }
  const NiduCoreRecursiveMutex mutex;
};

TEST_F(NiduCoreRecursiveMutexTest, StartsFreeWithItsFieldsInOrder) {
  expectFree();
  const void* const fields[] = {&mutex.lockCount, &mutex.semaphore, &mutex.recursionDepth, &mutex.owner};
  for (int field = 1; field < 4; ++field) EXPECT_TRUE(std::less<>()(fields[field - 1], fields[field]));
}

TEST_F(NiduCoreRecursiveMutexTest, ASecondThreadSleepsUntilTheLastUnlockAndThenOwnsTheLockOnce) {
  std::int32_t depth = -1;
  bool owned = false;
  for (int lock = 0; lock < 3; ++lock) mutex.lock();
  ObservedThread second([&] {
    mutex.lock();
    depth = mutex.recursionDepth;
    owned = isOwnedByThisThread();
    mutex.unlock();
  });
  for (int unlocks = 0; unlocks < 3; ++unlocks) {
    ASSERT_TRUE(second.isSeenAsleep()) << "after unlocks: " << unlocks;
    EXPECT_EQ(lockCount(), 2);
    mutex.unlock();
  }
  second.join();
  EXPECT_EQ(depth, 0);
  EXPECT_TRUE(owned);
  expectFree();
}

TEST_F(NiduCoreRecursiveMutexTest, ThreadsGetTheLockInOrderOfArrivalBeforeOneThatUnlocksAndLocksAgain) {
  std::vector<int> order;
  std::vector<std::unique_ptr<ObservedThread>> threads;
  mutex.lock();
  for (int thread = 0; thread < 5; ++thread) {
    threads.push_back(std::make_unique<ObservedThread>([&, thread] {
      mutex.lock();
      order.push_back(thread);
      mutex.unlock();
    }));
    ASSERT_TRUE(threads.back()->isSeenAsleep());
  }
  mutex.unlock();
  mutex.lock();
  order.push_back(5);
  mutex.unlock();
  EXPECT_THAT(order, testing::ElementsAre(0, 1, 2, 3, 4, 5));
}

TEST_F(NiduCoreRecursiveMutexTest, AThreadThatASignalHandlerInterruptsGoesOnWaiting) {
  installInterruptHandlers();
  bool held = true;
  bool sawItHeld = true;
  mutex.lock();
  ObservedThread waiting([&] {
    mutex.lock();
    sawItHeld = held;
    mutex.unlock();
  });
  for (int interruption = 0; interruption < 3; ++interruption) {
    ASSERT_TRUE(waiting.isSeenAsleep());
    waiting.interrupt(SIGUSR1);
  }
  ASSERT_TRUE(waiting.isSeenAsleep());
  held = false;
  mutex.unlock();
  waiting.join();
  EXPECT_FALSE(sawItHeld);
  expectFree();
}

TEST_F(NiduCoreRecursiveMutexTest, LosesNoIncrementOfEightThreadsSomeOfWhichUnlockWhatTheyDoNotHold) {
  int sum = 0;
  int inside = 0;
  int meetings = 0;
  runTogether(8, [&](int thread) {
    for (int i = 0; i < 5000; ++i) {
      if (thread % 2 == 0) mutex.unlock();
      mutex.lock();
      if (++inside != 1) ++meetings;
      mutex.lock();
      ++sum;
      mutex.unlock();
      --inside;
      mutex.unlock();
    }
  });
  EXPECT_EQ(sum, 40000);
  EXPECT_EQ(meetings, 0);
  expectFree();
}

TEST(NiduCoreRecursiveMutex, MayBeDestroyedWhileLocked) {
  NiduCoreRecursiveMutex mutex;
  mutex.lock();
  EXPECT_EQ(mutex.lockCount, 1);
}

}  // namespace
