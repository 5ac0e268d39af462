// The identity of a thread as a value that can also be "no thread".
//
// Threads: one thread may assign while others compare. They read the old value or the new one, and nothing
//          else is ordered by that.
#pragma once

#include <atomic>

#include <pthread.h>

class NiduThreadID {
 public:
  /// No thread.
  NiduThreadID() = default;
  NiduThreadID(NiduThreadID const& other);
  NiduThreadID& operator=(NiduThreadID const& other);
  /// Sets the value to no thread.
  ~NiduThreadID();

  /// The calling thread.
  static NiduThreadID CurrentThread();

  /// True when both name the same thread or both name none. A thread's value may come back for another
  /// thread once the first has ended.
  [[nodiscard]] bool IsEqual(NiduThreadID const& other) const;

 private:
  [[nodiscard]] pthread_t value() const { return thread.load(std::memory_order_relaxed); }
  void set(pthread_t newValue) { thread.store(newValue, std::memory_order_relaxed); }

  // Relaxed loads and stores compile to plain moves.
  std::atomic<pthread_t> thread{pthread_t{}};  // null (0): no thread
};
