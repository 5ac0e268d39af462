// SPDX-License-Identifier: MIT
// The guard that turns crashes, signals and exceptions that nobody caught into a known exit status.
#pragma once

struct AutoreleasePool;
struct ExceptionDelegate;

/// Throws once and catches, so that the unwinder of this program is ready. Call it before a plug-in is loaded.
///
/// A plug-in that was linked with a C++ runtime of its own, symbols hidden, also has its own unwinder. When it
/// throws, that one walks the stack, but the handlers in our frames use ours, which fills its tables when
/// something is first thrown through it. With empty tables it aborts.
void initialiseUnwinder();

/// The handler of every guarded signal: ends the process through exit(gCrashCode).
void signal_callback_handler(int);

/// Owns the process's autorelease pool and the delegate of its exception handler, and arms the guard.
///
/// main() makes one before it reads its arguments; the guard stays armed until main() returns.
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
