// SPDX-License-Identifier: MIT
// The way out after a crash, which always ends.
//
// A crash leaves through exit(), so that the at-exit guard speaks and standard output is flushed. exit() runs
// code of the plug-in, though, and takes locks that the crashed code may hold. Three safety nets make sure
// that the process ends all the same, with the same status and the same text: a signal stack of its own for
// the main thread (a stack overflow leaves room for nothing), an end at once when a second signal arrives on
// the way out, and a timer of one second.
#pragma once

/// True once the run has gone to its end: from then on the process may end without a word.
extern bool gExpectedEnd;

/// Exit status of the way out.
extern int gCrashCode;

/// Gives the calling thread's signal handlers a stack of their own, kept for the life of the process.
void prepareSignalStack();

/// Leaves through exit(gCrashCode), with the nets spread out. For signal handlers of any thread.
[[noreturn]] void leaveAfterCrash();

/// The at-exit guard: writes "unexpected exit" unless the end is expected. The run may still go on when it is
/// another thread that ends the process; it prints nothing any more.
void atExitFunction();
