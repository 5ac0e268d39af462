// SPDX-License-Identifier: MIT
// The end of the report: "unexpected exit", printed once, with no line of the run after it.
//
// Several threads and signal handlers may come to the end of the process at the same time, and a process that
// the plug-in has forked comes to an end of its own. The functions here decide which of them may still print.
#pragma once

/// Makes the calling process the one that prints. "unexpected exit" has not been printed yet.
void startReporting();

/// False in a process that the plug-in has forked: it shares the output, and what it printed there would be
/// taken for the run's. Always true before startReporting(). Safe inside a signal handler.
bool isReportingProcess();

/// Called by the thread that ends the process: from now on every other thread that wants to print a line waits
/// for the end of the process instead. Safe inside a signal handler.
void closeReport();

/// True once closeReport() has been called.
bool isReportClosed();

/// Waits for the end of the process if the report is closed. Called after each line and before a verdict is
/// given. On the thread that closed the report it aborts instead of waiting for itself: that thread is back
/// here only because an exit handler threw an exception out of exit().
void waitIfReportIsClosed();

/// Prints "unexpected exit", with no newline, unless it has been printed. Waits for stdout's lock.
void printUnexpectedExit();

/// The same with write(), without stdout's lock: for signal handlers, when the ordinary way may be blocked.
/// Prints nothing when the pipe is full, rather than wait for a host that has stopped reading.
void printUnexpectedExitDirectly();
