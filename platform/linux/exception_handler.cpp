// SPDX-License-Identifier: MIT
// The handler of uncaught exceptions on Linux: system exceptions, as they arrive as signals.
#include "platform/exception_handler.h"

#include <atomic>
#include <csignal>
#include <cstring>

#include <unistd.h>

struct AutoreleasePool {};
struct ExceptionDelegate {};

namespace {

struct SystemException {
  int signal;
  const char* logLine;
};
constexpr SystemException kSystemExceptions[] = {
    {SIGILL, "vsttorture: uncaught system exception: illegal instruction (SIGILL)\n"},
    {SIGFPE, "vsttorture: uncaught system exception: arithmetic error (SIGFPE)\n"},
    {SIGTRAP, "vsttorture: uncaught system exception: trap (SIGTRAP)\n"},
    {SIGSYS, "vsttorture: uncaught system exception: bad system call (SIGSYS)\n"},
};

// The delegate's; null while there is no delegate.
std::atomic<void (*)()> exitProcess{nullptr};
std::atomic<void (*)(int, siginfo_t*, void*)> recordFault{nullptr};

// Runs as a signal handler: calls nothing that is unsafe there.
void handleSystemException(int signal, siginfo_t* info, void* context) {
  if (void (*const exitNow)() = exitProcess) {
    recordFault.load()(signal, info, context);
    for (const SystemException& exception : kSystemExceptions) {
      if (exception.signal != signal) continue;
      [[maybe_unused]] const ssize_t written =
          write(STDERR_FILENO, exception.logLine, std::strlen(exception.logLine));
    }
    exitNow();
  }
  // Without a delegate the system does what it does by default.
  std::signal(signal, SIG_DFL);
  raise(signal);
}

}  // namespace

AutoreleasePool* makeAutoreleasePool() { return new AutoreleasePool(); }

void releaseAutoreleasePool(AutoreleasePool* pool) { delete pool; }

ExceptionDelegate* makeExceptionDelegate(const ExceptionDelegateActions& actions) {
  recordFault = actions.recordFault;
  exitProcess = actions.exitProcess;
  for (const SystemException& exception : kSystemExceptions) {
    struct sigaction action = {};
    action.sa_sigaction = handleSystemException;
    action.sa_flags = SA_SIGINFO | SA_ONSTACK | SA_NODEFER;
    sigaction(exception.signal, &action, nullptr);
  }
  actions.installSignalGuard();
  return new ExceptionDelegate();
}

void releaseExceptionDelegate(ExceptionDelegate* delegate) {
  exitProcess = nullptr;
  delete delegate;
}
