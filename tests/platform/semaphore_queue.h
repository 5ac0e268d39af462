// SPDX-License-Identifier: MIT
// A semaphore with threads that queue up for it one after the other.
#pragma once

#include <atomic>
#include <memory>
#include <vector>

#include "platform/mach_semaphore.h"
#include "tests/shared/observed_thread.h"

class SemaphoreQueue {
 public:
  explicit SemaphoreQueue(int tokens = 0) {
    semaphore_create(mach_task_self(), &semaphore, SYNC_POLICY_FIFO, tokens);
  }
  ~SemaphoreQueue() { destroy(); }

  /// Starts a thread that waits once. False unless it was seen asleep, at the end of the queue.
  bool addWaiter() {
    waiters.push_back(std::make_unique<Waiter>(semaphore));
    return waiters.back()->thread.isSeenAsleep();
  }

  bool isWaiting(int waiter) { return at(waiter).thread.isSeenAsleep(); }

  void interrupt(int waiter, int signal) { at(waiter).thread.interrupt(signal); }

  /// What the waiter's wait returned, once it has.
  kern_return_t resultOf(int waiter) {
    at(waiter).thread.join();
    return at(waiter).result;
  }

  /// Ends every wait that is still on.
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
