// SPDX-License-Identifier: MIT
// Faults that wait until the process ends.
#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <thread>

#include <unistd.h>

#include "plugins/faulty/faults.h"

namespace sample_plugins {
namespace {

using std::chrono::milliseconds;

bool crashesWhenDestroyed = false;

struct CrashesWhenDestroyed {
  ~CrashesWhenDestroyed() {
    if (crashesWhenDestroyed) storeToAddressZero();
  }
} crashesAtExit;

enum class WhenUnloaded { kNothing, kThrow, kPrint, kLinger };

WhenUnloaded whenUnloaded = WhenUnloaded::kNothing;
std::atomic<bool> isUnloaded{false};

/// Runs after every exit handler, including those that the host registered before it loaded the plug-in.
__attribute__((destructor)) void unload() {
  isUnloaded = true;
  if (whenUnloaded == WhenUnloaded::kThrow) throw 5;
  if (whenUnloaded == WhenUnloaded::kPrint) {
    std::fputs("a text without an end", stdout);
    std::fflush(stdout);
  }
  if (whenUnloaded == WhenUnloaded::kLinger) std::this_thread::sleep_for(milliseconds(300));
}

}  // namespace

void crashInEveryAtExit() {
  std::atexit([] {
    crashInEveryAtExit();
    storeToAddressZero();
  });
}

void crashInAtExit() { std::atexit(storeToAddressZero); }

void hangInAtExit() {
  std::atexit([] {
    for (;;) pause();
  });
}

void useHeapInAtExit() {
  std::atexit([] {
    void* volatile block = std::malloc(65536);  // Neither cached nor mapped on its own.
    std::free(block);
  });
}

void crashInStaticDestructor() { crashesWhenDestroyed = true; }

void throwWhenUnloaded() { whenUnloaded = WhenUnloaded::kThrow; }

void printWhenUnloaded() { whenUnloaded = WhenUnloaded::kPrint; }

/// The wait is limited, since a plug-in that is still being loaded is not unloaded.
void exitOnAThread() {
  whenUnloaded = WhenUnloaded::kLinger;
  std::thread([] { std::exit(exitStatus()); }).detach();
  for (int waited = 0; waited < 500 && !isUnloaded; ++waited) std::this_thread::sleep_for(milliseconds(1));
}

}  // namespace sample_plugins
