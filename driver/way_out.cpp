// SPDX-License-Identifier: MIT
#include "driver/way_out.h"

#include <atomic>
#include <csignal>
#include <cstdlib>

#include <sys/mman.h>
#include <unistd.h>

#include "driver/report.h"
#include "driver/safety_nets.h"

bool gExpectedEnd = false;
int gCrashCode = 0;

namespace {

constexpr unsigned kWayOutLimitInSeconds = 1;
constexpr std::size_t kSignalStackSizeInBytes = std::size_t{1} << 20;
constexpr std::size_t kGuardSizeInBytes = std::size_t{1} << 16;

constexpr int kOurSignals[] = {SIGINT, SIGABRT, SIGHUP,  SIGSEGV, SIGTERM, SIGBUS,
                               SIGILL, SIGFPE,  SIGTRAP, SIGSYS,  SIGALRM};

std::atomic<bool> leaving{false};

[[noreturn]] void endAtOnce() {
  if (!gExpectedEnd && isSpread(SafetyNet::kDirectLastWords)) printUnexpectedExitDirectly();
  _exit(gCrashCode);
}

void timeIsUp(int) { endAtOnce(); }

/// Also those that the plug-in has blocked, and the one that is being handled. No others: one of them may be
/// waiting that would kill the process without a word.
void letOurSignalsArrive() {
  sigset_t ours;
  sigemptyset(&ours);
  for (const int signal : kOurSignals) {
    sigaddset(&ours, signal);
  }
  pthread_sigmask(SIG_UNBLOCK, &ours, nullptr);
}

void limitTheWayOut() {
  struct sigaction action = {};
  action.sa_handler = timeIsUp;
  action.sa_flags = SA_ONSTACK | SA_NODEFER;
  sigaction(SIGALRM, &action, nullptr);
  alarm(kWayOutLimitInSeconds);
}

}  // namespace

void prepareSignalStack() {
  if (!isSpread(SafetyNet::kSignalStack)) return;
  const std::size_t size = kGuardSizeInBytes + kSignalStackSizeInBytes;
  void* memory = mmap(nullptr, size, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANON, -1, 0);
  if (memory == MAP_FAILED) return;
  mprotect(memory, kGuardSizeInBytes, PROT_NONE);
  stack_t stack = {};
  stack.ss_sp = static_cast<char*>(memory) + kGuardSizeInBytes;
  stack.ss_size = kSignalStackSizeInBytes;
  sigaltstack(&stack, nullptr);
}

void leaveAfterCrash() {
  // A child of vfork() shares the memory: its crash must leave no trace there.
  if (!isReportOurs()) _exit(gCrashCode);
  if (leaving.exchange(true) && isSpread(SafetyNet::kEndAtOnce)) endAtOnce();
  if (isSpread(SafetyNet::kClosedReport)) closeReport();
  if (isSpread(SafetyNet::kTimer)) limitTheWayOut();
  if (isSpread(SafetyNet::kSecondSignal)) letOurSignalsArrive();
  std::exit(gCrashCode);
}

void atExitFunction() {
  if (gExpectedEnd || !isReportOurs()) return;
  if (isSpread(SafetyNet::kClosedReport)) closeReport();
  printUnexpectedExit();
}
