// SPDX-License-Identifier: MIT
// The guard that turns crashes, signals and exceptions that nobody caught into a known exit status.
#pragma once

struct AutoreleasePool;
struct ExceptionDelegate;

/// Ends the process through exit(gCrashCode), whichever signal it is.
void signal_callback_handler(int);

/// Holds the process's autorelease pool and the delegate of its exception handler, and arms the guard.
///
/// Made once, first of all; the guard stays armed until the end of main().
class CPPAutoReleasePool {
 public:
  /// From now on a crash ends the process with this status.
  explicit CPPAutoReleasePool(int crashCode);
  /// Releases the pool, then the delegate.
  ~CPPAutoReleasePool();
  CPPAutoReleasePool(const CPPAutoReleasePool&) = delete;
  CPPAutoReleasePool& operator=(const CPPAutoReleasePool&) = delete;

 private:
  AutoreleasePool* pool = nullptr;
  ExceptionDelegate* delegate = nullptr;
};

/// Stores to address zero, so that the guard ends the process.
[[noreturn]] void crashOnPurpose();
