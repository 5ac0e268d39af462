// SPDX-License-Identifier: MIT
// The lines that a host reads: everything that this program prints on standard output, except for
// "unexpected exit" (driver/last_words.h).
//
// Each line is flushed before the work that it announces begins, so the last line names the step in which the
// process died. A process that the plug-in has forked prints no line. Once one thread is ending the process,
// the other threads print no line.
#pragma once

/// Number of the last step line. Each step line increments it first; never reset.
extern int gStep;

/// The phase or test under way, for the failure line. Null before the first.
extern const char* gCurTest;

/// Call before the first line. Makes stdout unbuffered: exit() would otherwise flush a line a second time
/// when a signal interrupts the first flush. Makes stdout byte-oriented: printf() prints nothing on a stream
/// on which the plug-in has used wide characters first. Calls startReporting().
void openReport();

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
