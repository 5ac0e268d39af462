// SPDX-License-Identifier: MIT
// The system's handler for exceptions that nobody caught, and the pool and delegate that arm it.
//
// On macOS: Foundation's NSAutoreleasePool and NSExceptionHandler with an Objective-C++ delegate. On Linux:
// the same in C++, where the exceptions are the system exceptions that arrive as SIGILL, SIGFPE, SIGTRAP and
// SIGSYS. Each one reaches the delegate three times: shall it be displayed (no), logged (yes, one line on
// standard error), handled (leaves the process).
//
// Ownership: what a make function returns is released once, by releasing it.
// Threads:   make and release on the main thread; the delegate may be asked on any.
#pragma once

/// What the delegate does at two points of its life.
struct ExceptionDelegateActions {
  void (*installSignalGuard)();  ///< At the end of its init.
  void (*exitProcess)();         ///< When it is asked to handle an exception. Does not return.
};

struct AutoreleasePool;
struct ExceptionDelegate;

/// The process's outermost autorelease pool.
AutoreleasePool* makeAutoreleasePool();
void releaseAutoreleasePool(AutoreleasePool* pool);

/// A delegate (nidu_VST_Support_ExceptionHandlerDelegate) that is the default exception handler's from now
/// on, with all ten log and handle bits of its mask set (1023).
ExceptionDelegate* makeExceptionDelegate(const ExceptionDelegateActions& actions);
/// Detaches it from the handler.
void releaseExceptionDelegate(ExceptionDelegate* delegate);
