// SPDX-License-Identifier: MIT
// The recursive lock between real threads. Order of arrival and interruptions are those of the semaphore
// (tests/platform), which the lock waits for as lock_calls_test.cpp shows.
#include <functional>
#include <type_traits>

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
