// SPDX-License-Identifier: MIT
// The default exception handler on Linux: system exceptions, as they arrive as signals.
#include "platform/exception_handler.h"

#include <csignal>
#include <cstring>

#include <unistd.h>

struct AutoreleasePool {};

namespace {

constexpr unsigned kLogUncaughtSystemExceptionMask = 1u << 2;
constexpr unsigned kHandleUncaughtSystemExceptionMask = 1u << 3;
constexpr unsigned kAllExceptionsMask = 0x3FF;

/// The line that the system writes when the delegate wants an exception logged. Safe in a signal handler.
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

}  // namespace

class nidu_VST_Support_ExceptionHandlerDelegate {
 public:
  void init(const ExceptionDelegateActions& actions);
  void dealloc();
  [[nodiscard]] bool shouldDisplayException() const { return false; }
  [[nodiscard]] bool shouldLogException(const SystemException&, unsigned) const { return true; }
  bool shouldHandleException(const SystemException&, unsigned) const {
    exitProcess();
    return true;
  }

 private:
  void (*exitProcess)() = nullptr;
};

struct ExceptionDelegate : nidu_VST_Support_ExceptionHandlerDelegate {};

namespace {

/// One for the process. Without a delegate the system does with an exception what it always does.
class ExceptionHandler {
 public:
  void setDelegate(const nidu_VST_Support_ExceptionHandlerDelegate* newDelegate) { delegate = newDelegate; }
  void setExceptionHandlingMask(unsigned newMask);
  void raise(const SystemException& exception) const;

 private:
  const nidu_VST_Support_ExceptionHandlerDelegate* volatile delegate = nullptr;
  volatile unsigned mask = 0;
};

ExceptionHandler defaultExceptionHandler;

void systemExceptionCallback(int signal) {
  for (const SystemException& exception : kSystemExceptions) {
    if (exception.signal == signal) defaultExceptionHandler.raise(exception);
  }
  // Not handled: what the system does by default happens when the fault repeats, or is asked for here.
  std::signal(signal, SIG_DFL);
  ::raise(signal);
}

void ExceptionHandler::setExceptionHandlingMask(unsigned newMask) {
  mask = newMask;
  for (const SystemException& exception : kSystemExceptions) {
    struct sigaction action = {};
    action.sa_handler = systemExceptionCallback;
    action.sa_flags = SA_ONSTACK | SA_NODEFER;
    sigaction(exception.signal, &action, nullptr);
  }
}

void ExceptionHandler::raise(const SystemException& exception) const {
  if (delegate == nullptr) return;
  const auto* asked = delegate;
  if ((mask & kLogUncaughtSystemExceptionMask) != 0 &&
      asked->shouldLogException(exception, kLogUncaughtSystemExceptionMask)) {
    [[maybe_unused]] const ssize_t written =
        write(STDERR_FILENO, exception.logLine, std::strlen(exception.logLine));
  }
  if ((mask & kHandleUncaughtSystemExceptionMask) != 0) {
    asked->shouldHandleException(exception, kHandleUncaughtSystemExceptionMask);
  }
}

}  // namespace

void nidu_VST_Support_ExceptionHandlerDelegate::init(const ExceptionDelegateActions& actions) {
  exitProcess = actions.exitProcess;
  defaultExceptionHandler.setDelegate(this);
  defaultExceptionHandler.setExceptionHandlingMask(kAllExceptionsMask);
  actions.installSignalGuard();
}

void nidu_VST_Support_ExceptionHandlerDelegate::dealloc() { defaultExceptionHandler.setDelegate(nullptr); }

AutoreleasePool* makeAutoreleasePool() { return new AutoreleasePool(); }

void releaseAutoreleasePool(AutoreleasePool* pool) { delete pool; }

ExceptionDelegate* makeExceptionDelegate(const ExceptionDelegateActions& actions) {
  auto* delegate = new ExceptionDelegate();
  delegate->init(actions);
  return delegate;
}

void releaseExceptionDelegate(ExceptionDelegate* delegate) {
  delegate->dealloc();
  delete delegate;
}
