// SPDX-License-Identifier: MIT
// Threads that begin their work at the same moment, so that they meet in what they share.
#pragma once

#include <atomic>
#include <thread>
#include <vector>

/// Runs `work(thread)`, with 0 to count - 1, on `count` threads, none of which begins before all of them run.
/// Returns when all have finished.
template <typename Work>
void runTogether(int count, Work work) {
  std::atomic<int> missing{count};
  std::vector<std::thread> threads;
  for (int thread = 0; thread < count; ++thread) {
    threads.emplace_back([&, thread] {
      --missing;
      while (missing > 0) std::this_thread::yield();
      work(thread);
    });
  }
  for (std::thread& thread : threads) thread.join();
}
