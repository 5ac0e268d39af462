// SPDX-License-Identifier: MIT
// The exit after a crash, which always ends the process.
//
// A crash ends the process through exit(), so that the at-exit guard prints "unexpected exit" and stdout is
// flushed. But exit() also runs code of the plug-in, and takes locks that the crashed code may hold. Three
// safety nets make sure that the process still ends, with the same status and the same text: a signal stack
// for the main thread (after a stack overflow its own stack has no room for a handler), an immediate _exit()
// when a second signal arrives during the exit, and a timer of one second.
#pragma once

/// True once the run has ended by itself: from then on the process may end without "unexpected exit".
extern bool gExpectedEnd;

/// Exit status after a crash.
extern int gCrashCode;

/// Gives the signal handlers of the calling thread a stack of their own, for the life of the process.
void installSignalStack();

/// Ends the process through exit(gCrashCode), with the safety nets in place. Can be called in a signal
/// handler on any thread.
[[noreturn]] void exitAfterCrash();

/// The at-exit guard: prints "unexpected exit" unless the end is expected. The run may still be going on when
/// another thread has called exit(); it prints no further line.
void atExitFunction();
