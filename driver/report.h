// SPDX-License-Identifier: MIT
// The lines that a host reads: everything that this program prints on standard output.
//
// Each line is flushed before the work that it announces begins, so the last line names the step in which a
// process died.
#pragma once

/// Number of the last step line. Each step line counts it up first; never reset.
extern int gStep;

/// The phase or test under way, for the failure line. Null before the first.
extern const char* gCurTest;

/// Before the first line: from now on standard output keeps nothing back. What exit() finds in a buffer it
/// writes, and a signal at the wrong moment would leave a line there that has been written already.
/// The report belongs to the process that opens it.
void openReport();

/// False in a process that the plug-in has forked: it shares the output, but what it prints would be taken
/// for the run's. Nothing here prints a line there. Safe inside a signal handler.
bool isReportOurs();

/// "!too few arguments. syntax is command pathtovst childID(optional)"
void printUsage();
/// "total, COUNT"
void printTotal(int count);
/// "NUMBER, TEXT", with the next step number.
void printStep(const char* text);
/// "!PHASE failed CODE"
void printFailure(int code);
/// "!PHASE failed, unknown error"
void printFailure();
/// "unexpected exit", with no newline, unless it has been said.
void printUnexpectedExit();

/// The same past standard output's buffer and lock: for signal handlers, when the ordinary way may be
/// blocked. Does not wait for a host that has stopped reading.
void printUnexpectedExitDirectly();

/// Nothing may follow the last words: from now on a thread that wants to print a line waits for the end of
/// the process instead. Safe inside a signal handler. Called by the thread that ends the process.
void closeReport();
/// Waits for the end of the process if the report is closed. Called before a verdict is given. The thread
/// that closed it would wait for itself: an exit handler has thrown it out of exit(), which is a crash.
void waitIfReportIsClosed();
