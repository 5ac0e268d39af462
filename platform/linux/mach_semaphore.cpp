// SPDX-License-Identifier: MIT
// Mach semaphores on futexes.
//
// A signal hands its token directly to a waiter: it takes the first waiter out of the queue and writes the
// outcome into a word on that waiter's stack. With a plain POSIX semaphore the signalling thread could take
// its token back at once, thousands of times in a row, while the waiter starves.
//
// Lifetimes:
// - One lock guards the queues of all semaphores, and it outlives them. So a thread that received the last
//   token may destroy the semaphore while the signalling thread has not yet returned from semaphore_signal(),
//   and an interrupted waiter may look at its outcome after the semaphore is gone.
// - As soon as an outcome is written, the waiter may return, and its word on the stack may be reused. The
//   wake that follows passes only the word's address to the kernel. If another futex is at that address by
//   then, it is woken without cause, which every user of a futex has to expect anyway.
#include "platform/mach_semaphore.h"

#include <atomic>
#include <cerrno>
#include <cstdint>
#include <mutex>
#include <new>

#include <linux/futex.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace {

constexpr task_t kThisTask = 1;

enum Outcome : std::uint32_t { kStillWaiting, kTokenReceived, kSemaphoreDestroyed };

/// One sleeping thread; lives on its stack. `outcome` changes once, under the lock, by the thread that takes
/// the waiter out of the queue.
struct Waiter {
  std::atomic<std::uint32_t> outcome{kStillWaiting};
  Waiter* next = nullptr;
};

std::mutex queuesLock;

/// Sleeps while `word` holds kStillWaiting. False when a signal handler ended the sleep; after true the word
/// may hold any outcome.
bool sleepOn(const std::atomic<std::uint32_t>& word) {
  const long result = syscall(SYS_futex, &word, FUTEX_WAIT_PRIVATE, kStillWaiting, nullptr, nullptr, 0);
  return result == 0 || errno != EINTR;
}

/// Ends the wait of a waiter that was taken out of its queue. The waiter may no longer exist when this
/// returns. Call it with the lock held, then wake() with the result; the wake needs no lock.
const void* settle(Waiter& waiter, Outcome outcome) {
  waiter.outcome.store(outcome, std::memory_order_release);
  return &waiter.outcome;
}

void wake(const void* word) { syscall(SYS_futex, word, FUTEX_WAKE_PRIVATE, 1, nullptr, nullptr, 0); }

kern_return_t resultOf(std::uint32_t outcome) {
  return outcome == kTokenReceived ? KERN_SUCCESS : KERN_TERMINATED;
}

}  // namespace

struct MachSemaphore {
  int tokens;
  Waiter* first = nullptr;  // in order of arrival; null while there are tokens

  /// The link that points to `waiter`; for null the one at the end of the queue.
  Waiter** linkTo(const Waiter* waiter) {
    Waiter** link = &first;
    while (*link != waiter) link = &(*link)->next;
    return link;
  }
};

task_t mach_task_self() { return kThisTask; }

kern_return_t semaphore_create(task_t task, semaphore_t* semaphore, int policy, int value) {
  *semaphore = nullptr;
  if (task != kThisTask || policy != SYNC_POLICY_FIFO || value < 0) return KERN_INVALID_ARGUMENT;
  *semaphore = new (std::nothrow) MachSemaphore{value};
  return *semaphore ? KERN_SUCCESS : KERN_RESOURCE_SHORTAGE;
}

kern_return_t semaphore_destroy(task_t task, semaphore_t semaphore) {
  if (!semaphore || task != kThisTask) return KERN_INVALID_ARGUMENT;
  {
    const std::lock_guard<std::mutex> guard(queuesLock);
    while (Waiter* const waiter = semaphore->first) {
      semaphore->first = waiter->next;
      wake(settle(*waiter, kSemaphoreDestroyed));
    }
  }
  delete semaphore;
  return KERN_SUCCESS;
}

kern_return_t semaphore_wait(semaphore_t semaphore) {
  if (!semaphore) return KERN_INVALID_ARGUMENT;
  Waiter me;
  {
    const std::lock_guard<std::mutex> guard(queuesLock);
    if (semaphore->tokens > 0) {
      --semaphore->tokens;
      return KERN_SUCCESS;
    }
    *semaphore->linkTo(nullptr) = &me;
  }
  for (;;) {
    const std::uint32_t outcome = me.outcome.load(std::memory_order_acquire);
    if (outcome != kStillWaiting) return resultOf(outcome);
    if (sleepOn(me.outcome)) continue;

    // Interrupted. A token that came meanwhile must not be lost, so the outcome is read once more, under the
    // lock. Without an outcome the semaphore still exists and this waiter is in its queue.
    const std::lock_guard<std::mutex> guard(queuesLock);
    if (me.outcome.load(std::memory_order_acquire) != kStillWaiting) continue;
    *semaphore->linkTo(&me) = me.next;
    return KERN_ABORTED;
  }
}

kern_return_t semaphore_signal(semaphore_t semaphore) {
  if (!semaphore) return KERN_INVALID_ARGUMENT;
  const void* word = nullptr;
  {
    const std::lock_guard<std::mutex> guard(queuesLock);
    Waiter* const waiter = semaphore->first;
    if (!waiter) {
      ++semaphore->tokens;
      return KERN_SUCCESS;
    }
    semaphore->first = waiter->next;
    word = settle(*waiter, kTokenReceived);
  }
  wake(word);
  return KERN_SUCCESS;
}
