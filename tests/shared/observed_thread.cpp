// SPDX-License-Identifier: MIT
// Threads whose state is read from /proc.
#include "tests/shared/observed_thread.h"

#include <array>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <utility>

#include <pthread.h>
#include <signal.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace {

constexpr std::chrono::microseconds kPollInterval{200};

void ignoreSignal(int) {}

/// The bit of `signal` in the mask that the line "SigPnd:" of a thread's status gives.
bool isPending(const std::string& status, int signal) {
  const std::string key = "SigPnd:";
  const auto at = status.find(key);
  if (at == std::string::npos) return false;
  return (std::strtoull(status.c_str() + at + key.size(), nullptr, 16) >> (signal - 1) & 1) != 0;
}

}  // namespace

void installInterruptHandlers() {
  struct sigaction action {};
  action.sa_handler = ignoreSignal;
  sigaction(SIGUSR1, &action, nullptr);
  action.sa_flags = SA_RESTART;
  sigaction(SIGUSR2, &action, nullptr);
}

bool becomesTrue(const std::function<bool()>& condition) {
  const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(60);
  while (!condition()) {
    if (std::chrono::steady_clock::now() > deadline) return false;
    std::this_thread::sleep_for(kPollInterval);
  }
  return true;
}

ObservedThread::ObservedThread(std::function<void()> body)
    : thread([this, run = std::move(body)] {
        id = static_cast<int>(syscall(SYS_gettid));
        run();
        finished = true;
      }) {}

ObservedThread::~ObservedThread() { join(); }

void ObservedThread::join() {
  if (!thread.joinable()) return;
  if (!becomesTrue([this] { return hasFinished(); })) {
    std::fputs("a thread never returned from its wait\n", stderr);
    std::abort();
  }
  thread.join();
}

bool ObservedThread::isSeenAsleep() const {
  bool asleep = false;
  // Twice in a row in the same call: a lock inside the C library or a sanitizer would be free by then, as
  // nobody else is at work.
  becomesTrue([&] {
    std::string first;
    std::string second;
    if (hasFinished()) return true;
    if (!sleepsOnFutex(first)) return false;
    std::this_thread::sleep_for(kPollInterval);
    asleep = sleepsOnFutex(second) && first == second;
    return asleep;
  });
  return asleep;
}

void ObservedThread::interrupt(int signal) {
  becomesTrue([this] { return id != 0; });
  pthread_kill(thread.native_handle(), signal);
  becomesTrue([&] { return hasFinished() || !isPending(procFile("status"), signal); });
}

std::string ObservedThread::procFile(const char* name) const {
  // A thread that ends meanwhile gives an empty text, as does a file that may not be read.
  const std::string path = "/proc/self/task/" + std::to_string(id) + "/" + name;
  std::string text;
  if (std::FILE* const file = std::fopen(path.c_str(), "re")) {
    std::array<char, 4096> buffer;
    text.assign(buffer.data(), std::fread(buffer.data(), 1, buffer.size(), file));
    std::fclose(file);
  }
  return text;
}

bool ObservedThread::sleepsOnFutex(std::string& call) const {
  if (id == 0) return false;
  call = procFile("syscall");
  if (!call.empty()) return call.rfind(std::to_string(SYS_futex) + " ", 0) == 0;
  // Kernels that do not show the call show at least where the thread sleeps.
  call = procFile("wchan");
  return call.find("futex") != std::string::npos && procFile("stat").find(") S ") != std::string::npos;
}
