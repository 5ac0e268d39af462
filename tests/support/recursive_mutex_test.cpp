// SPDX-License-Identifier: MIT
// The recursive lock, one or two threads at a time.
#include <functional>
#include <thread>
#include <type_traits>

#include <signal.h>

#include "gtest/gtest.h"
#include "support/atomic_add.h"
#include "support/recursive_mutex.h"
#include "tests/shared/observed_thread.h"

namespace {

static_assert(!std::is_copy_constructible_v<NiduCoreRecursiveMutex>);
static_assert(!std::is_copy_assignable_v<NiduCoreRecursiveMutex>);

class NiduCoreRecursiveMutexState : public testing::Test {
 protected:
  /// The counter, read in a way that is safe while other threads lock.
  std::int32_t lockCount() { return AtomicAdd32Implementation(&mutex.lockCount, 0); }
  bool isOwnedByThisThread() const { return mutex.owner.IsEqual(NiduThreadID::CurrentThread()); }
  void expectFree() {
    EXPECT_EQ(lockCount(), 0);
    EXPECT_EQ(mutex.recursionDepth, 0);
    EXPECT_TRUE(mutex.owner.IsEqual(NiduThreadID()));
  }
  static void onAnotherThread(const std::function<void()>& body) { std::thread(body).join(); }

  const NiduCoreRecursiveMutex mutex;
};

TEST_F(NiduCoreRecursiveMutexState, IsFreeAtFirst) { expectFree(); }

TEST_F(NiduCoreRecursiveMutexState, FieldsStandInTheirOrder) {
  const void* const fields[] = {&mutex.lockCount, &mutex.semaphore, &mutex.recursionDepth, &mutex.owner};
  for (int field = 1; field < 4; ++field) {
    EXPECT_TRUE(std::less<>()(fields[field - 1], fields[field])) << "field " << field;
  }
}

TEST_F(NiduCoreRecursiveMutexState, RecursionCountsInItsDepthAlone) {
  for (int depth = 0; depth < 3; ++depth) {
    mutex.lock();
    EXPECT_EQ(lockCount(), 1);
    EXPECT_EQ(mutex.recursionDepth, depth);
    EXPECT_TRUE(isOwnedByThisThread());
  }
  for (int depth = 2; depth > 0; --depth) {
    mutex.unlock();
    EXPECT_EQ(lockCount(), 1);
    EXPECT_EQ(mutex.recursionDepth, depth - 1);
    EXPECT_TRUE(isOwnedByThisThread());
  }
  mutex.unlock();
  expectFree();
}

TEST_F(NiduCoreRecursiveMutexState, AFirstLockStartsWithoutDepth) {
  mutex.recursionDepth = 5;
  mutex.lock();
  EXPECT_EQ(mutex.recursionDepth, 0);
  mutex.unlock();
  expectFree();
}

TEST_F(NiduCoreRecursiveMutexState, AnUnlockOfAFreeLockChangesNothing) {
  mutex.unlock();
  expectFree();
  mutex.lock();
  EXPECT_EQ(lockCount(), 1);
  mutex.unlock();
}

TEST_F(NiduCoreRecursiveMutexState, AnUnlockByAnotherThreadChangesNothing) {
  mutex.lock();
  mutex.lock();
  onAnotherThread([this] { mutex.unlock(); });
  EXPECT_EQ(lockCount(), 1);
  EXPECT_EQ(mutex.recursionDepth, 1);
  EXPECT_TRUE(isOwnedByThisThread());
  mutex.unlock();
  mutex.unlock();
  expectFree();
}

TEST_F(NiduCoreRecursiveMutexState, ASecondThreadSleepsUntilTheLastUnlockAndThenOwnsTheLockOnce) {
  std::int32_t depth = -1;
  bool owned = false;
  mutex.lock();
  mutex.lock();
  mutex.lock();
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

TEST_F(NiduCoreRecursiveMutexState, AThreadThatUnlocksAndLocksAgainComesAfterTheOneThatWaits) {
  for (int round = 0; round < 20; ++round) {
    bool ran = false;
    mutex.lock();
    ObservedThread waiting([&] {
      mutex.lock();
      ran = true;
      mutex.unlock();
    });
    ASSERT_TRUE(waiting.isSeenAsleep());
    mutex.unlock();
    mutex.lock();
    EXPECT_TRUE(ran) << "round " << round;
    mutex.unlock();
  }
}

TEST_F(NiduCoreRecursiveMutexState, AnInterruptedThreadGoesOnWaiting) {
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
  EXPECT_TRUE(isOwnedByThisThread());
  held = false;
  mutex.unlock();
  waiting.join();
  EXPECT_FALSE(sawItHeld);
  expectFree();
}

TEST(NiduCoreRecursiveMutex, MayBeDestroyedWhileLocked) {
  NiduCoreRecursiveMutex mutex;
  mutex.lock();
  mutex.lock();
  EXPECT_EQ(mutex.recursionDepth, 1);
}

}  // namespace
