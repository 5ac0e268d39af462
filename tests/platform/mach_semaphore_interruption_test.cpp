// SPDX-License-Identifier: MIT
// Semaphores whose waiters are interrupted by a signal handler, or lose their semaphore.
#include <atomic>
#include <chrono>

#include <signal.h>

#include "gtest/gtest.h"
#include "platform/mach_semaphore.h"
#include "tests/platform/semaphore_queue.h"
#include "tests/shared/observed_thread.h"

namespace {

std::atomic<bool> handlerEntered;
std::atomic<bool> tokenGiven;

/// Holds the interrupted thread until the token was given. Not for ever: a sanitizer may run a handler later
/// than the system does, where the thread holds a lock.
void awaitToken(int) {
  handlerEntered = true;
  const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(100);
  while (!tokenGiven && std::chrono::steady_clock::now() < deadline) {
  }
}

class MachSemaphoreInterruption : public testing::TestWithParam<int> {
 protected:
  void SetUp() override { installInterruptHandlers(); }
  SemaphoreQueue queue;
};

TEST_P(MachSemaphoreInterruption, AbortsTheWaitAndLeavesTheOthersInTheirOrder) {
  const int interrupted = GetParam();
  for (int waiter = 0; waiter < 3; ++waiter) ASSERT_TRUE(queue.addWaiter());
  queue.interrupt(interrupted, SIGUSR1);
  EXPECT_EQ(queue.resultOf(interrupted), 14);
  ASSERT_TRUE(queue.addWaiter()) << "whoever comes now stands behind the rest";

  for (int waiter = 0; waiter < 4; ++waiter) {
    if (waiter == interrupted) continue;
    ASSERT_TRUE(queue.isWaiting(waiter));
    semaphore_signal(queue.semaphore);
    EXPECT_EQ(queue.resultOf(waiter), 0);
  }
  ASSERT_TRUE(queue.addWaiter()) << "a token was left over";
}

INSTANTIATE_TEST_SUITE_P(OfWaiter, MachSemaphoreInterruption, testing::Values(0, 1, 2));

TEST(MachSemaphore, AnInterruptionOfTheOnlyWaiterLeavesAnEmptyQueue) {
  installInterruptHandlers();
  SemaphoreQueue queue;
  ASSERT_TRUE(queue.addWaiter());
  queue.interrupt(0, SIGUSR1);
  EXPECT_EQ(queue.resultOf(0), 14);
  semaphore_signal(queue.semaphore);
  EXPECT_EQ(semaphore_wait(queue.semaphore), 0);
}

TEST(MachSemaphore, AHandlerThatRestartsCallsDoesNotAbortTheWait) {
  installInterruptHandlers();
  SemaphoreQueue queue;
  ASSERT_TRUE(queue.addWaiter());
  queue.interrupt(0, SIGUSR2);
  ASSERT_TRUE(queue.isWaiting(0));
  semaphore_signal(queue.semaphore);
  EXPECT_EQ(queue.resultOf(0), 0);
}

TEST(MachSemaphore, ATokenGivenWhileTheHandlerRunsIsReceivedOrStillThere) {
  struct sigaction action {};
  action.sa_handler = awaitToken;
  sigaction(SIGUSR1, &action, nullptr);
  handlerEntered = false;
  tokenGiven = false;

  SemaphoreQueue queue;
  ASSERT_TRUE(queue.addWaiter());
  queue.interrupt(0, SIGUSR1);
  ASSERT_TRUE(becomesTrue([] { return handlerEntered.load(); }));
  semaphore_signal(queue.semaphore);
  tokenGiven = true;
  const bool received = queue.resultOf(0) == 0;
  const bool stillThere = !queue.addWaiter();
  EXPECT_NE(received, stillThere);
}

TEST(MachSemaphore, TokensGivenAmongInterruptionsAllArrive) {
  installInterruptHandlers();
  constexpr int kTokens = 300;
  SemaphoreQueue queue;
  std::atomic<int> received{0};
  std::atomic<int> unexpected{0};
  ObservedThread waiter([&] {
    for (;;) {
      const kern_return_t result = semaphore_wait(queue.semaphore);
      if (result == 0) {
        if (++received == kTokens) return;
      } else if (result != 14) {
        ++unexpected;
        return;
      }
    }
  });
  for (int token = 0; token < kTokens; ++token) {
    if (token % 2 == 0) semaphore_signal(queue.semaphore);
    waiter.interrupt(SIGUSR1);
    if (token % 2 != 0) semaphore_signal(queue.semaphore);
  }
  EXPECT_TRUE(becomesTrue([&] { return waiter.hasFinished(); })) << received << " tokens arrived";
  if (!waiter.hasFinished()) queue.destroy();
  waiter.join();
  EXPECT_EQ(received, 300);
  EXPECT_EQ(unexpected, 0);
}

TEST(MachSemaphore, DestructionEndsEveryWait) {
  SemaphoreQueue queue;
  for (int waiter = 0; waiter < 3; ++waiter) ASSERT_TRUE(queue.addWaiter());
  EXPECT_EQ(queue.destroy(), 0);
  for (int waiter = 0; waiter < 3; ++waiter) EXPECT_EQ(queue.resultOf(waiter), 37);
}

TEST(MachSemaphore, WhoReceivesTheLastTokenMayDestroyTheSemaphoreAtOnce) {
  for (int round = 0; round < 100; ++round) {
    semaphore_t semaphore{};
    ASSERT_EQ(semaphore_create(mach_task_self(), &semaphore, 0, 0), 0);
    kern_return_t destroyed = -1;
    ObservedThread receiver([&] {
      semaphore_wait(semaphore);
      destroyed = semaphore_destroy(mach_task_self(), semaphore);
    });
    if (round % 10 == 0) {
      ASSERT_TRUE(receiver.isSeenAsleep());
    }
    EXPECT_EQ(semaphore_signal(semaphore), 0);
    receiver.join();
    EXPECT_EQ(destroyed, 0);
  }
}

TEST(MachSemaphore, AnInterruptionAtTheMomentOfDestructionIsOneOfTheTwo) {
  installInterruptHandlers();
  for (int round = 0; round < 30; ++round) {
    SemaphoreQueue queue;
    ASSERT_TRUE(queue.addWaiter());
    ObservedThread destroyer([&] { queue.destroy(); });
    queue.interrupt(0, SIGUSR1);
    const kern_return_t result = queue.resultOf(0);
    EXPECT_TRUE(result == 14 || result == 37) << result;
    destroyer.join();
  }
}

}  // namespace
