// SPDX-License-Identifier: MIT
// The recursive lock under many threads.
#include <memory>
#include <thread>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/recursive_mutex.h"
#include "tests/shared/observed_thread.h"

namespace {

using testing::ElementsAre;

constexpr int kIncrements = 2000;

TEST(NiduCoreRecursiveMutexContention, ThreadsGetTheLockInTheOrderTheyAskedForIt) {
  const NiduCoreRecursiveMutex mutex;
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
  for (const auto& thread : threads) thread->join();
  EXPECT_THAT(order, ElementsAre(0, 1, 2, 3, 4));
}

TEST(NiduCoreRecursiveMutexContention, NoIncrementOfEightThreadsIsLost) {
  const NiduCoreRecursiveMutex mutex;
  int sum = 0;
  int inside = 0;
  int meetings = 0;
  std::vector<std::thread> threads;
  for (int thread = 0; thread < 8; ++thread) {
    threads.emplace_back([&] {
      for (int i = 0; i < kIncrements; ++i) {
        mutex.lock();
        if (++inside != 1) ++meetings;
        mutex.lock();
        ++sum;
        mutex.unlock();
        --inside;
        mutex.unlock();
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(sum, 8 * kIncrements);
  EXPECT_EQ(meetings, 0);
  EXPECT_EQ(mutex.lockCount, 0);
}

TEST(NiduCoreRecursiveMutexContention, ForeignUnlocksDoNotDisturbTheOthers) {
  const NiduCoreRecursiveMutex mutex;
  int sum = 0;
  std::vector<std::thread> threads;
  for (int thread = 0; thread < 4; ++thread) {
    threads.emplace_back([&, intrudes = thread % 2 == 0] {
      for (int i = 0; i < 500; ++i) {
        if (intrudes) mutex.unlock();
        mutex.lock();
        ++sum;
        mutex.unlock();
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(sum, 2000);
  EXPECT_EQ(mutex.lockCount, 0);
}

}  // namespace
