// SPDX-License-Identifier: MIT
#include "driver/crash_guard.h"

#include <csignal>
#include <cstdlib>

#include "driver/crash_exit.h"
#include "driver/last_words.h"
#include "driver/safety_nets.h"
#include "flight_recorder/flight_recorder.h"
#include "platform/exception_handler.h"
#include "platform/fault_context.h"
#include "platform/thread_number.h"

namespace {

// On purpose: SIGKILL is in the list although the system refuses a handler for it. No result is checked.
constexpr int kGuardedSignals[] = {SIGINT, SIGABRT, SIGHUP, SIGKILL, SIGSEGV, SIGTERM, SIGBUS};

/// Puts the fault on the flight record, for the first of them in an observed run.
void recordFault(int signal, siginfo_t* info, void* context) {
  if (!isReportingProcess() || !noteFault(signal)) return;
  // The signal stands on the record before the arguments are looked at: a plug-in that calls this handler out
  // of its own may pass anything.
  const std::uint64_t place = programCounterOf(context);
  const auto sender = static_cast<std::uint32_t>(info->si_code > 0 ? 0 : info->si_pid);
  noteFaultDetails({info->si_code, currentThreadNumber(), sender, faultAddressOf(*info), place});
  static LoadedImage image;
  if (findLoadedImage(place, image)) noteFaultModule(image.path, image.address);
}

void handleSignal(int signal, siginfo_t* info, void* context) {
  recordFault(signal, info, context);
  signal_callback_handler(signal);
}

/// Lets the handler see what the fault is about and run on the signal stack, and lets a second signal arrive
/// while the first is handled.
void makeHandlerSafe(int signal) {
  struct sigaction action = {};
  if (sigaction(signal, nullptr, &action) != 0) return;
  action.sa_sigaction = handleSignal;
  action.sa_flags |= SA_SIGINFO | SA_ONSTACK;
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
  delegate = makeExceptionDelegate({installSignalGuard, recordFault, exitAfterCrash});
}

CPPAutoReleasePool::~CPPAutoReleasePool() {
  releaseAutoreleasePool(pool);
  releaseExceptionDelegate(delegate);
}

__attribute__((no_sanitize("undefined"))) void crashOnPurpose() {
  noteVerdict(kFlightNoInstance);
  // The pointer and the integer are both volatile: the optimiser removes any other store to address 0.
  volatile int* volatile nowhere = nullptr;
  *nowhere = 0;  // NOLINT(clang-analyzer-core.NullDereference): it is meant to crash
  std::abort();
}
