// SPDX-License-Identifier: MIT
// Semaphores: results, order of arrival, hand-over. Interruption and destruction have files of their own.
#include <cstdlib>
#include <memory>
#include <new>
#include <vector>

#include "gtest/gtest.h"
#include "platform/mach_semaphore.h"
#include "tests/platform/semaphore_queue.h"
#include "tests/shared/observed_thread.h"

namespace {

bool outOfMemory = false;

}  // namespace

// The semaphores' memory, which can be made to run out.
void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
  return outOfMemory ? nullptr : ::operator new(size);
}

namespace {

TEST(MachSemaphore, KernelNumbersAreTheSystems) {
  EXPECT_EQ(KERN_SUCCESS, 0);
  EXPECT_EQ(KERN_INVALID_ARGUMENT, 4);
  EXPECT_EQ(KERN_RESOURCE_SHORTAGE, 6);
  EXPECT_EQ(KERN_ABORTED, 14);
  EXPECT_EQ(KERN_TERMINATED, 37);
  EXPECT_EQ(SYNC_POLICY_FIFO, 0);
}

TEST(MachSemaphore, ANullSemaphoreIsAnInvalidArgument) {
  EXPECT_EQ(semaphore_wait(semaphore_t{}), 4);
  EXPECT_EQ(semaphore_signal(semaphore_t{}), 4);
  EXPECT_EQ(semaphore_destroy(mach_task_self(), semaphore_t{}), 4);
}

struct RefusedCreation {
  const char* name;
  bool ownTask;
  int policy;
  int value;
};

class MachSemaphoreRefusedCreation : public testing::TestWithParam<RefusedCreation> {};

TEST_P(MachSemaphoreRefusedCreation, AnswersInvalidArgumentAndGivesNoSemaphore) {
  const RefusedCreation& row = GetParam();
  semaphore_t semaphore = nullptr;
  ASSERT_EQ(semaphore_create(mach_task_self(), &semaphore, 0, 0), 0);
  const std::unique_ptr<MachSemaphore, void (*)(semaphore_t)> first(
      semaphore, [](semaphore_t created) { semaphore_destroy(mach_task_self(), created); });
  EXPECT_EQ(semaphore_create(row.ownTask ? mach_task_self() : 0, &semaphore, row.policy, row.value), 4);
  EXPECT_EQ(semaphore, nullptr);
}

INSTANTIATE_TEST_SUITE_P(, MachSemaphoreRefusedCreation,
                         testing::Values(RefusedCreation{"NoTask", false, 0, 0},
                                         RefusedCreation{"AnotherPolicy", true, 1, 0},
                                         RefusedCreation{"ANegativeValue", true, 0, -1}),
                         [](const auto& row) { return row.param.name; });

TEST(MachSemaphore, WithoutMemoryCreationAnswersResourceShortage) {
  semaphore_t semaphore = nullptr;
  outOfMemory = true;
  const kern_return_t result = semaphore_create(mach_task_self(), &semaphore, 0, 0);
  outOfMemory = false;
  EXPECT_EQ(result, 6);
  EXPECT_EQ(semaphore, nullptr);
}

TEST(MachSemaphore, OnlyItsOwnTaskDestroysASemaphore) {
  semaphore_t semaphore = nullptr;
  ASSERT_EQ(semaphore_create(mach_task_self(), &semaphore, 0, 1), 0);
  EXPECT_EQ(semaphore_destroy(0, semaphore), 4);
  EXPECT_EQ(semaphore_wait(semaphore), 0) << "it must still be there";
  EXPECT_EQ(semaphore_destroy(mach_task_self(), semaphore), 0);
}

TEST(MachSemaphore, TokensOfCreationAndOfEarlierSignalsAreTakenWithoutSleeping) {
  SemaphoreQueue queue(2);
  EXPECT_EQ(semaphore_signal(queue.semaphore), 0);
  for (int token = 0; token < 3; ++token) EXPECT_EQ(semaphore_wait(queue.semaphore), 0);
  ASSERT_TRUE(queue.addWaiter()) << "a fourth token was there";
  EXPECT_EQ(semaphore_signal(queue.semaphore), 0);
  EXPECT_EQ(queue.resultOf(0), 0);
}

TEST(MachSemaphore, ServesWaitersInOrderOfArrivalOnePerSignal) {
  SemaphoreQueue queue;
  for (int waiter = 0; waiter < 5; ++waiter) ASSERT_TRUE(queue.addWaiter());
  for (int waiter = 0; waiter < 5; ++waiter) {
    EXPECT_EQ(semaphore_signal(queue.semaphore), 0);
    EXPECT_EQ(queue.resultOf(waiter), 0);
    for (int later = waiter + 1; later < 5; ++later) EXPECT_TRUE(queue.isWaiting(later)) << later;
  }
}

TEST(MachSemaphore, TheSignallingThreadCannotTakeItsTokenBack) {
  SemaphoreQueue queue;
  for (int round = 0; round < 20; ++round) {
    bool tokenArrived = false;
    ObservedThread other([&] {
      semaphore_wait(queue.semaphore);
      tokenArrived = true;
      semaphore_signal(queue.semaphore);
    });
    ASSERT_TRUE(other.isSeenAsleep());
    semaphore_signal(queue.semaphore);
    ASSERT_EQ(semaphore_wait(queue.semaphore), 0);
    EXPECT_TRUE(tokenArrived) << "round " << round;
  }
}

}  // namespace
