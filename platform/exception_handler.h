// SPDX-License-Identifier: MIT
// The system's handler for uncaught exceptions, and the pool and delegate that belong to it.
//
// - On macOS: Foundation's NSAutoreleasePool and NSExceptionHandler. The handler asks its Objective-C++
//   delegate whether to display an exception (no), to log it (yes), and to handle it (the process exits).
// - On Linux: a handler of the system exceptions that arrive as SIGILL, SIGFPE, SIGTRAP and SIGSYS. While
//   there is a delegate, it logs each with one line on standard error and the process exits. The pool is
//   empty.
//
// Ownership: the caller releases what a make function returns, once, with the release function below it.
// Threads:   make and release on the main thread. An exception is handled on the thread that it occurs on.
#pragma once

#include <csignal>

/// What the delegate calls.
struct ExceptionDelegateActions {
  void (*installSignalGuard)();  ///< Called once, at the end of its initialisation.
  /// Called before anything else is done about a system exception, with the arguments of a signal handler.
  /// Never called on macOS.
  void (*recordFault)(int signal, siginfo_t* info, void* context);
  void (*exitProcess)();  ///< Called to handle an exception. Does not return.
};

struct AutoreleasePool;
struct ExceptionDelegate;

/// The process's outermost autorelease pool.
AutoreleasePool* makeAutoreleasePool();
void releaseAutoreleasePool(AutoreleasePool* pool);

/// Makes a delegate and gives it to the default exception handler. On macOS it is a
/// nidu_VST_Support_ExceptionHandlerDelegate, and all ten log and handle bits of the handler's mask are set
/// (1023).
ExceptionDelegate* makeExceptionDelegate(const ExceptionDelegateActions& actions);
/// Takes the delegate away from the handler: the system then treats exceptions as it does by default.
void releaseExceptionDelegate(ExceptionDelegate* delegate);
