// SPDX-License-Identifier: MIT
// A counting semaphore, made of one of the Mach kernel.
#include "support/semaphore.h"

#include "platform/mach_semaphore.h"

struct NiduSemaphore::Implementation {
  semaphore_t semaphore{};
};

NiduSemaphore::NiduSemaphore() : implementation(std::make_unique<Implementation>()) {
  // On purpose: the result is not checked. The program has one thread of its own, which never waits, so it
  // works without a semaphore.
  semaphore_create(mach_task_self(), &implementation->semaphore, SYNC_POLICY_FIFO, 0);
}

NiduSemaphore::~NiduSemaphore() { semaphore_destroy(mach_task_self(), implementation->semaphore); }

int NiduSemaphore::wait() {
  kern_return_t result = KERN_ABORTED;
  while (result == KERN_ABORTED) result = semaphore_wait(implementation->semaphore);
  return result;
}

int NiduSemaphore::signal() { return semaphore_signal(implementation->semaphore); }
