// SPDX-License-Identifier: MIT
// Semaphores: results, order of arrival, interruption by signal handlers, destruction.
#include <atomic>
#include <chrono>
#include <memory>
#include <new>
#include <vector>

#include <signal.h>

#include "gtest/gtest.h"
#include "platform/mach_semaphore.h"
#include "tests/shared/observed_thread.h"

namespace {

bool outOfMemory = false;

}  // namespace

// The semaphores' memory, which can be made to run out.
void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
  return outOfMemory ? nullptr : ::operator new(size);
}

namespace {

// A semaphore with threads that queue up for it one after the other.
class SemaphoreQueue {
 public:
  explicit SemaphoreQueue(int tokens = 0) { semaphore_create(mach_task_self(), &semaphore, 0, tokens); }
  ~SemaphoreQueue() { destroy(); }

  // Starts a thread that waits once. False unless it was seen asleep, at the end of the queue.
  bool addWaiter() {
    waiters.push_back(std::make_unique<Waiter>(semaphore));
    return waiters.back()->thread.isSeenAsleep();
  }
  bool isWaiting(int waiter) { return at(waiter).thread.isSeenAsleep(); }
  void interrupt(int waiter, int signal) { at(waiter).thread.interrupt(signal); }

  // What the waiter's wait returned, once it has.
  kern_return_t resultOf(int waiter) {
    at(waiter).thread.join();
    return at(waiter).result;
  }

  // Ends every wait that still goes on.
  kern_return_t destroy() {
    const kern_return_t result = semaphore_destroy(mach_task_self(), semaphore);
    semaphore = semaphore_t{};
    return result;
  }

  semaphore_t semaphore{};

 private:
  struct Waiter {
    explicit Waiter(semaphore_t where) : thread([this, where] { result = semaphore_wait(where); }) {}
    kern_return_t result = -1;
    ObservedThread thread;
  };
  Waiter& at(int waiter) { return *waiters.at(static_cast<std::size_t>(waiter)); }

  std::vector<std::unique_ptr<Waiter>> waiters;
};

class MachSemaphore : public testing::Test {
 protected:
  MachSemaphore() { installInterruptHandlers(); }
};

TEST_F(MachSemaphore, ANullSemaphoreIsAnInvalidArgument) {
  EXPECT_EQ(semaphore_wait(semaphore_t{}), 4);
  EXPECT_EQ(semaphore_signal(semaphore_t{}), 4);
  EXPECT_EQ(semaphore_destroy(mach_task_self(), semaphore_t{}), 4);
}

TEST_F(MachSemaphore, ACreationThatFailsSetsTheSemaphoreToNull) {
  const SemaphoreQueue any;
  const auto resultOfCreation = [&](task_t task, int policy, int value) {
    semaphore_t semaphore = any.semaphore;
    const kern_return_t result = semaphore_create(task, &semaphore, policy, value);
    EXPECT_EQ(semaphore, nullptr);
    return result;
  };
  EXPECT_EQ(resultOfCreation(0, 0, 0), 4) << "no task";
  EXPECT_EQ(resultOfCreation(mach_task_self(), 1, 0), 4) << "another policy";
  EXPECT_EQ(resultOfCreation(mach_task_self(), 0, -1), 4) << "a negative value";
  outOfMemory = true;
  EXPECT_EQ(resultOfCreation(mach_task_self(), 0, 0), 6);
  outOfMemory = false;
}

TEST_F(MachSemaphore, OnlyItsOwnTaskDestroysASemaphore) {
  SemaphoreQueue queue(1);
  EXPECT_EQ(semaphore_destroy(0, queue.semaphore), 4);
  EXPECT_EQ(semaphore_wait(queue.semaphore), 0) << "it must still be there";
  EXPECT_EQ(queue.destroy(), 0);
}

TEST_F(MachSemaphore, TokensOfCreationAndOfEarlierSignalsAreTakenWithoutSleeping) {
  SemaphoreQueue queue(2);
  EXPECT_EQ(semaphore_signal(queue.semaphore), 0);
  for (int token = 0; token < 3; ++token) EXPECT_EQ(semaphore_wait(queue.semaphore), 0);
  ASSERT_TRUE(queue.addWaiter()) << "a fourth token was there";
}

TEST_F(MachSemaphore, ServesWaitersInOrderOfArrivalOnePerSignal) {
  SemaphoreQueue queue;
  for (int waiter = 0; waiter < 5; ++waiter) ASSERT_TRUE(queue.addWaiter());
  for (int waiter = 0; waiter < 5; ++waiter) {
    EXPECT_EQ(semaphore_signal(queue.semaphore), 0);
    EXPECT_EQ(queue.resultOf(waiter), 0);
    for (int later = waiter + 1; later < 5; ++later) EXPECT_TRUE(queue.isWaiting(later)) << later;
  }
}

TEST_F(MachSemaphore, TheSignallingThreadCannotTakeItsTokenBack) {
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

struct Interrupted {
  int waiters;
  int interrupted;
};
class MachSemaphoreInterruption : public MachSemaphore, public testing::WithParamInterface<Interrupted> {};

TEST_P(MachSemaphoreInterruption, AbortsOneWaitAndLeavesTheOthersInTheirOrder) {
  const auto [waiters, interrupted] = GetParam();
  SemaphoreQueue queue;
  for (int waiter = 0; waiter < waiters; ++waiter) ASSERT_TRUE(queue.addWaiter());
  queue.interrupt(interrupted, SIGUSR1);
  EXPECT_EQ(queue.resultOf(interrupted), 14);
  ASSERT_TRUE(queue.addWaiter()) << "this one queues up behind the rest";

  for (int waiter = 0; waiter <= waiters; ++waiter) {
    if (waiter == interrupted) continue;
    ASSERT_TRUE(queue.isWaiting(waiter));
    semaphore_signal(queue.semaphore);
    EXPECT_EQ(queue.resultOf(waiter), 0);
  }
  ASSERT_TRUE(queue.addWaiter()) << "a token was left over";
}

INSTANTIATE_TEST_SUITE_P(, MachSemaphoreInterruption,
                         testing::Values(Interrupted{1, 0}, Interrupted{3, 0}, Interrupted{3, 1},
                                         Interrupted{3, 2}));

TEST_F(MachSemaphore, AHandlerThatRestartsCallsDoesNotAbortTheWait) {
  SemaphoreQueue queue;
  ASSERT_TRUE(queue.addWaiter());
  queue.interrupt(0, SIGUSR2);
  ASSERT_TRUE(queue.isWaiting(0));
  semaphore_signal(queue.semaphore);
  EXPECT_EQ(queue.resultOf(0), 0);
}

std::atomic<bool> handlerEntered;
std::atomic<bool> tokenGiven;

// Keeps the interrupted thread in the handler until the token was given, at most 100 ms: a sanitizer may run
// a handler later than the system does, while the thread holds a lock that the giving of the token needs.
void awaitToken(int) {
  handlerEntered = true;
  const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(100);
  while (!tokenGiven && std::chrono::steady_clock::now() < deadline) {
  }
}

TEST_F(MachSemaphore, ATokenGivenWhileTheHandlerRunsIsReceivedOrStillThere) {
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

TEST_F(MachSemaphore, TokensGivenAmongInterruptionsAllArrive) {
  SemaphoreQueue queue;
  int received = 0;
  kern_return_t result = 0;
  ObservedThread waiter([&] {
    while (received < 300 && (result == 0 || result == 14)) {
      result = semaphore_wait(queue.semaphore);
      if (result == 0) ++received;
    }
  });
  for (int token = 0; token < 300; ++token) {
    if (token % 2 == 0) semaphore_signal(queue.semaphore);
    waiter.interrupt(SIGUSR1);
    if (token % 2 != 0) semaphore_signal(queue.semaphore);
  }
  // Ends a wait for a token that was lost.
  if (!becomesTrue([&] { return waiter.hasFinished(); })) queue.destroy();
  waiter.join();
  EXPECT_EQ(received, 300);
  EXPECT_EQ(result, 0);
}

TEST_F(MachSemaphore, DestructionEndsEveryWait) {
  SemaphoreQueue queue;
  for (int waiter = 0; waiter < 3; ++waiter) ASSERT_TRUE(queue.addWaiter());
  EXPECT_EQ(queue.destroy(), 0);
  for (int waiter = 0; waiter < 3; ++waiter) EXPECT_EQ(queue.resultOf(waiter), 37);
}

TEST_F(MachSemaphore, WhoReceivesTheLastTokenMayDestroyTheSemaphoreAtOnce) {
  for (int round = 0; round < 100; ++round) {
    SemaphoreQueue queue;
    kern_return_t destroyed = -1;
    const semaphore_t semaphore = queue.semaphore;
    ObservedThread receiver([&] {
      semaphore_wait(semaphore);
      destroyed = queue.destroy();
    });
    if (round % 10 == 0) {
      ASSERT_TRUE(receiver.isSeenAsleep());
    }
    EXPECT_EQ(semaphore_signal(semaphore), 0);
    receiver.join();
    EXPECT_EQ(destroyed, 0);
  }
}

TEST_F(MachSemaphore, AnInterruptionAtTheMomentOfDestructionGivesOneOfTheTwoResults) {
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
