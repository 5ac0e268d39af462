// SPDX-License-Identifier: MIT
// The end of the report: "unexpected exit", printed once, with no line of the run after it.
//
// Several threads and signal handlers may end the process at the same time, and a process that the plug-in
// has forked ends as well. The functions here decide which of them may still print.
#pragma once

/// Makes the calling process the one that prints. "unexpected exit" has not been printed yet.
void startReporting();

/// False in a process that the plug-in has forked: it shares stdout, and a host would take its lines for the
/// run's. Always true before startReporting(). Safe inside a signal handler.
bool isReportingProcess();

/// Called by the thread that ends the process: from now on every other thread that wants to print a line
/// waits for the end of the process instead. Safe inside a signal handler.
void closeReport();

/// True once closeReport() has been called.
bool isReportClosed();

/// Waits for the end of the process if the report is closed. Called after each line and before main()
/// returns. Aborts on the thread that closed the report, which would wait for itself: that thread comes back
/// here only when an exit handler has thrown an exception out of exit().
void waitIfReportIsClosed();

/// Prints "unexpected exit" without a newline, unless it has been printed already. Waits for stdout's lock.
void printUnexpectedExit();

/// The same with write() and without stdout's lock: for signal handlers, where printUnexpectedExit() may
/// block. Prints nothing when the pipe is full, instead of waiting for a host that has stopped reading.
void printUnexpectedExitDirectly();
