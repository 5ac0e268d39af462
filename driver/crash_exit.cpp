// SPDX-License-Identifier: MIT
#include "driver/crash_exit.h"

#include <atomic>
#include <csignal>
#include <cstdlib>

#include <sys/mman.h>
#include <unistd.h>

#include "driver/last_words.h"
#include "driver/safety_nets.h"
#include "flight_recorder/flight_recorder.h"

bool gExpectedEnd = false;
int gCrashCode = 0;

namespace {

constexpr unsigned kExitLimitInSeconds = 1;
constexpr std::size_t kSignalStackSizeInBytes = std::size_t{1} << 20;
constexpr std::size_t kGuardSizeInBytes = std::size_t{1} << 16;

constexpr int kOurSignals[] = {SIGINT, SIGABRT, SIGHUP,  SIGSEGV, SIGTERM, SIGBUS,
                               SIGILL, SIGFPE,  SIGTRAP, SIGSYS,  SIGALRM};

std::atomic<bool> isExiting{false};

[[noreturn]] void exitNow() {
  if (!gExpectedEnd && isEnabled(SafetyNet::kDirectLastWords)) printUnexpectedExitDirectly();
  _exit(gCrashCode);
}

void onExitTimeout(int) { exitNow(); }

/// Unblocks the signals listed above, including the one that is being handled and those that the plug-in has
/// blocked. All other signals stay as they are: one without a handler may be pending, and would kill the
/// process before it can print "unexpected exit".
void unblockOurSignals() {
  sigset_t ours;
  sigemptyset(&ours);
  for (const int signal : kOurSignals) {
    sigaddset(&ours, signal);
  }
  pthread_sigmask(SIG_UNBLOCK, &ours, nullptr);
}

void armExitTimer() {
  struct sigaction action = {};
  action.sa_handler = onExitTimeout;
  action.sa_flags = SA_ONSTACK | SA_NODEFER;
  sigaction(SIGALRM, &action, nullptr);
  alarm(kExitLimitInSeconds);
}

}  // namespace

void installSignalStack() {
  if (!isEnabled(SafetyNet::kSignalStack)) return;
  const std::size_t size = kGuardSizeInBytes + kSignalStackSizeInBytes;
  void* memory = mmap(nullptr, size, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANON, -1, 0);
  if (memory == MAP_FAILED) return;
  mprotect(memory, kGuardSizeInBytes, PROT_NONE);
  stack_t stack = {};
  stack.ss_sp = static_cast<char*>(memory) + kGuardSizeInBytes;
  stack.ss_size = kSignalStackSizeInBytes;
  sigaltstack(&stack, nullptr);
}

void exitAfterCrash() {
  // A child of vfork() shares our memory: it must change nothing there when it crashes.
  if (!isReportingProcess()) _exit(gCrashCode);
  if (isExiting.exchange(true) && isEnabled(SafetyNet::kExitNow)) exitNow();
  if (isEnabled(SafetyNet::kClosedReport)) closeReport();
  if (isEnabled(SafetyNet::kTimer)) armExitTimer();
  if (isEnabled(SafetyNet::kSecondSignal)) unblockOurSignals();
  std::exit(gCrashCode);
}

void atExitFunction() {
  if (gExpectedEnd || !isReportingProcess()) return;
  noteUnexpectedExit();
  if (isEnabled(SafetyNet::kClosedReport)) closeReport();
  printUnexpectedExit();
}
