// SPDX-License-Identifier: MIT
// The wrapper's lock compared with the standard one, without contention: locked and unlocked once, and locked
// again by the thread that holds it.
#include <mutex>

#include <benchmark/benchmark.h>

#include "support/recursive_mutex.h"

namespace {

template <class Mutex>
void lockAndUnlock(benchmark::State& state) {
  Mutex mutex;
  for ([[maybe_unused]] auto _ : state) {
    mutex.lock();
    benchmark::ClobberMemory();
    mutex.unlock();
  }
}

/// Measures one further lock and unlock by the owner.
template <class Mutex>
void recurse(benchmark::State& state) {
  Mutex mutex;
  mutex.lock();
  for ([[maybe_unused]] auto _ : state) {
    mutex.lock();
    benchmark::ClobberMemory();
    mutex.unlock();
  }
  mutex.unlock();
}

BENCHMARK_TEMPLATE(lockAndUnlock, NiduCoreRecursiveMutex);
BENCHMARK_TEMPLATE(lockAndUnlock, std::recursive_mutex);
BENCHMARK_TEMPLATE(recurse, NiduCoreRecursiveMutex);
BENCHMARK_TEMPLATE(recurse, std::recursive_mutex);

}  // namespace

BENCHMARK_MAIN();
