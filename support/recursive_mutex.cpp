// SPDX-License-Identifier: MIT
// The recursive lock: an atomic counter of threads, and a semaphore for those that have to wait.
#include "support/recursive_mutex.h"

#include "support/atomic_add.h"

NiduCoreRecursiveMutex::~NiduCoreRecursiveMutex() { owner = NiduThreadID(); }

void NiduCoreRecursiveMutex::lock() const {
  const NiduThreadID me = NiduThreadID::CurrentThread();
  if (owner.IsEqual(me)) {
    ++recursionDepth;
    return;
  }
  const std::int32_t previous = AtomicAdd32Implementation(&lockCount, +1);
  if (previous > 0) semaphore.wait();
  owner = me;
  recursionDepth = 0;
}

void NiduCoreRecursiveMutex::unlock() const {
  const NiduThreadID me = NiduThreadID::CurrentThread();
  // On purpose: an unlock by a thread that does not hold the lock is ignored.
  if (!owner.IsEqual(me)) return;
  if (recursionDepth > 0) {
    --recursionDepth;
    return;
  }
  // Cleared before the count goes down: from then on, the next thread may store itself as the owner.
  owner = NiduThreadID();
  const std::int32_t previous = AtomicAdd32Implementation(&lockCount, -1);
  if (previous - 1 > 0) semaphore.signal();
}
