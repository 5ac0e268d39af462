// SPDX-License-Identifier: MIT
// The identity of a thread as a value that can also be "no thread".
//
// Threads: one thread may assign while others compare. They read the old value or the new one; the access
//          orders no other memory access.
//
// Everything is inline, because the lock compares identities twice for each parameter value.
#pragma once

#include <atomic>

#include <pthread.h>

class NiduThreadID {
 public:
  /// No thread.
  NiduThreadID() = default;
  NiduThreadID(NiduThreadID const& other) : thread(other.value()) {}
  NiduThreadID& operator=(NiduThreadID const& other) {
    set(other.value());
    return *this;
  }
  /// Sets the value to no thread.
  ~NiduThreadID() { set(pthread_t{}); }

  /// The calling thread.
  static NiduThreadID CurrentThread() {
    NiduThreadID current;
    current.set(pthread_self());
    return current;
  }

  /// True when both name the same thread or both name none. The system may reuse a thread's value for another
  /// thread once the first has ended.
  [[nodiscard]] bool IsEqual(NiduThreadID const& other) const;

 private:
  [[nodiscard]] pthread_t value() const { return thread.load(std::memory_order_relaxed); }
  void set(pthread_t newValue) { thread.store(newValue, std::memory_order_relaxed); }

  // Relaxed loads and stores compile to plain moves.
  std::atomic<pthread_t> thread{pthread_t{}};  // null (0): no thread
};

inline bool NiduThreadID::IsEqual(NiduThreadID const& other) const {
  constexpr pthread_t kNoThread{};
  const pthread_t mine = value();
  const pthread_t others = other.value();
  if (mine == kNoThread || others == kNoThread) return mine == kNoThread && others == kNoThread;
  return mine == others || pthread_equal(mine, others) != 0;
}
