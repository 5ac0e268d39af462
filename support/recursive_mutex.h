// SPDX-License-Identifier: MIT
// A lock that its owner may take again; cheap while no other thread wants it.
//
// The first lock costs one atomic addition, each further one by the owner none. Only a thread that has to
// wait, and the one that wakes it, call the kernel. Waiting threads get the lock in order of arrival.
//
// Failures: none is reported. If the semaphore could not be created, threads that should wait do not.
// Threads:  any thread may call any operation. A const object can be locked, so the state is mutable.
#pragma once

#include <cstdint>

#include "support/semaphore.h"
#include "support/thread_id.h"

class NiduCoreRecursiveMutex {
 public:
  NiduCoreRecursiveMutex() = default;
  /// Does not check that the lock is free.
  ~NiduCoreRecursiveMutex();
  NiduCoreRecursiveMutex(NiduCoreRecursiveMutex const&) = delete;
  NiduCoreRecursiveMutex& operator=(NiduCoreRecursiveMutex const&) = delete;

  /// Takes the lock, sleeping while another thread holds it. Each lock needs an unlock().
  void lock() const;

  /// Undoes one lock(); the last one passes the lock to the next thread. Ignored when the calling thread does
  /// not hold the lock.
  void unlock() const;

  // The state of the lock, public so that tests can look at it. Only lock() and unlock() change it.
  mutable std::int32_t lockCount = 0;       // threads that hold or wait for the lock; changed only atomically
  mutable NiduSemaphore semaphore;          // where waiting threads sleep
  mutable std::int32_t recursionDepth = 0;  // locks of the owner beyond its first; only the owner looks at it
  mutable NiduThreadID owner;               // no thread while the lock is free; others only compare
};
