// SPDX-License-Identifier: MIT
// The recursive lock: an atomic counter, and a semaphore for those who come too late.
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
  // On purpose: who does not hold the lock changes nothing and is not told.
  if (!owner.IsEqual(me)) return;
  if (recursionDepth > 0) {
    --recursionDepth;
    return;
  }
  // Nobody's before it is free: once the count is down, the owner is the next thread's to write.
  owner = NiduThreadID();
  const std::int32_t previous = AtomicAdd32Implementation(&lockCount, -1);
  if (previous - 1 > 0) semaphore.signal();
}
