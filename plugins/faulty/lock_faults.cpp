// SPDX-License-Identifier: MIT
// Crashes that leave something locked which exit() may need.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <future>
#include <mutex>
#include <thread>

#include <unistd.h>

#include "plugins/faulty/faults.h"

namespace sample_plugins {
namespace {

/// Does `work` on a thread that stays for ever, and returns when the work is done.
void doOnAThreadThatStays(void (*work)()) {
  std::promise<void> done;
  std::future<void> isDone = done.get_future();
  std::thread([work, promise = std::move(done)]() mutable {
    work();
    promise.set_value();
    for (;;) pause();
  }).detach();
  isDone.wait();
}

/// A plug-in that cleans up under its lock when the process ends.
struct CleansUpAtExit {
  std::mutex lock;
  ~CleansUpAtExit() { const std::lock_guard<std::mutex> guard(lock); }
} cleansUpAtExit;

}  // namespace

/// The heap notices a damaged list of free blocks inside malloc, while it holds its own lock. It takes that
/// lock only once a second thread exists.
void crashWithHeapLock() {
  doOnAThreadThatStays([] {});
  constexpr std::size_t kSize = 65536;  // Neither cached nor mapped on its own.
  void* volatile before = std::malloc(kSize);
  void* volatile damaged = std::malloc(kSize);
  void* volatile after = std::malloc(kSize);
  std::free(damaged);
  // A free block begins with the links to the next and the last one in its list. This one is in no list.
  static std::uintptr_t another[64];
  auto* links = static_cast<volatile std::uintptr_t*>(damaged);
  links[0] = links[1] = reinterpret_cast<std::uintptr_t>(another);
  void* volatile more = std::malloc(kSize + kSize / 2);
  std::free(more);
  std::free(before);
  std::free(after);
  complain("the heap did not notice its damaged list");
}

/// Another thread holds the stream's lock and never gives it back.
void crashWithStdoutLock() {
  doOnAThreadThatStays([] { flockfile(stdout); });
  storeToAddressZero();
}

void holdStdoutLock() {
  doOnAThreadThatStays([] { flockfile(stdout); });
}

/// The crashing thread holds the stream's lock itself.
void crashWithOwnStdoutLock() {
  flockfile(stdout);
  storeToAddressZero();
}

/// The destructor waits for the lock that its own thread crashed under.
void crashUnderDestructorLock() {
  const std::lock_guard<std::mutex> guard(cleansUpAtExit.lock);
  storeToAddressZero();
}

}  // namespace sample_plugins
