// SPDX-License-Identifier: MIT
#include "driver/crash_guard.h"

#include <csignal>
#include <cstdlib>

#include "driver/crash_exit.h"
#include "driver/safety_nets.h"
#include "platform/exception_handler.h"

namespace {

// On purpose: SIGKILL is in the list although the system refuses a handler for it. No result is checked.
constexpr int kGuardedSignals[] = {SIGINT, SIGABRT, SIGHUP, SIGKILL, SIGSEGV, SIGTERM, SIGBUS};

/// Lets the handler run on the signal stack, and lets a second signal arrive while the first is handled.
void makeHandlerSafe(int signal) {
  struct sigaction action = {};
  if (sigaction(signal, nullptr, &action) != 0) return;
  action.sa_flags |= SA_ONSTACK;
  if (isEnabled(SafetyNet::kSecondSignal)) action.sa_flags |= SA_NODEFER;
  sigaction(signal, &action, nullptr);
}

void installSignalGuard() {
  installSignalStack();
  for (const int signal : kGuardedSignals) {
    std::signal(signal, signal_callback_handler);
    makeHandlerSafe(signal);
  }
}

}  // namespace

void initialiseUnwinder() {
  try {
    throw 0;
  } catch (int) {
  }
}

void signal_callback_handler(int) { exitAfterCrash(); }

CPPAutoReleasePool::CPPAutoReleasePool(int crashCode) {
  gCrashCode = crashCode;
  pool = makeAutoreleasePool();
  delegate = makeExceptionDelegate({installSignalGuard, exitAfterCrash});
}

CPPAutoReleasePool::~CPPAutoReleasePool() {
  releaseAutoreleasePool(pool);
  releaseExceptionDelegate(delegate);
}

__attribute__((no_sanitize("undefined"))) void crashOnPurpose() {
  // The pointer and the integer are both volatile: the optimiser removes any other store to address 0.
  volatile int* volatile nowhere = nullptr;
  *nowhere = 0;  // NOLINT(clang-analyzer-core.NullDereference): it is meant to crash
  std::abort();
}
