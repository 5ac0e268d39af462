// SPDX-License-Identifier: MIT
// What goes wrong, as the environment variable FAULT_KIND says. The names are in the table of faults.cpp.
//
// Several faults, joined by a plus sign, are committed one after the other: print+null_store. One that ends
// in "@load" is committed while the module is loaded, the others at FAULT_PLACE:
// buffer_stdout@load+raise:SIGKILL.
//
// FAULT_STATUS is the status that the exiting faults end with, 0 when it is not set. raise and raise_in_atexit
// take the signal's name after a colon: raise:SIGTERM. long_texts takes the request whose answer is too long:
// long_texts:45. Without a request it applies to all text requests.
#pragma once

#include <string>

#include "vst2/basic_types.h"

namespace sample_plugins {

/// Commits the faults of FAULT_KIND: with `whileLoading` those that end in "@load", else the others. Returns
/// from those faults that leave the plug-in running.
void commitFaults(bool whileLoading);

/// The request, by its opcode, that is answered with 4000 bytes of text from now on.
extern VstInt32 longTextRequest;
constexpr VstInt32 kNoRequest = -1;
constexpr VstInt32 kEveryRequest = -2;

/// The entry point answers null from now on.
extern bool yieldsNoInstance;

/// effGetChunk (23) is answered with a size of 100 bytes and a null pointer from now on.
extern bool answersNullChunk;

/// For a test that asks for something that does not exist: prints the problem on standard error and ends the
/// process with status 125.
[[noreturn]] void complain(const std::string& problem);

/// The status that the exiting faults end the process with.
int exitStatus();

/// The plainest crash.
void storeToAddressZero();

// Faults in the memory, each of which ends in a signal.
void writeToReadOnlyMemory();
void overflowTheStack();
void freeTwice();
void writeBehindABlock();

// Crashes that leave something locked which exit() may need.
void crashWithHeapLock();
void crashWithStdoutLock();
void crashWithOwnStdoutLock();
void crashUnderDestructorLock();
/// No crash: whoever prints next waits for ever.
void holdStdoutLock();

// Faults on a thread of the plug-in's own.
void crashOnAThread();
void throwOnAThread();
void overflowTheStackOfAThread();
/// The crash of one thread has begun and waits in an exit handler; the run goes on meanwhile.
void crashOnAThreadBehindTheRun();
/// The process ends on one thread, slowly; the run goes on meanwhile.
void exitOnAThread();
/// Ends the thread that the host called on.
void leaveTheThread();

// Faults that wait until the process ends.
void crashInAtExit();
/// Each of these handlers registers the next one before it crashes.
void crashInEveryAtExit();
void crashInStaticDestructor();
void hangInAtExit();
void useHeapInAtExit();
/// These two happen after every exit handler.
void throwWhenUnloaded();
void printWhenUnloaded();

// Faults of the process: the plug-in changes what it shares with its host.
void replaceHandlersThenCrash();
void blockSignalsThenCrash();
/// Signals that report a crash still arrive.
void blockSignalsButCrashes();
void bufferStdout();
void closeStdout();
void floodStdout();
void changeLocaleAndDirectory();
void trapFloatingPoint();

// Faults of processes that the plug-in starts.
void forkKeepingStdout();
/// These two have a session of their own.
void daemonKeepingStdout();
void daemonFloodingStdout();
void forkChildThatGoesOn();
void forkChildThatExits();
void forkChildThatCrashes();
void vforkChildThatCrashes();
void becomeAnotherProgram();

// Forgeries: what looks as if it came from the host.
/// All lines of a run that passes.
void forgeLines();
/// The same, from a child; the plug-in waits for its end.
void forgeLinesInAChild();
/// The line of step 7, which is due behind the first request of step 6 (effGetTailSize, 52).
void forgeStep();
/// The line of a failure in step 6.
void forgeFailure();
void forgeLastWords();
/// These two write over the host's flight record, which it keeps in a file named "record".
void scribbleOverTheRecord();
void wipeTheRecord();

}  // namespace sample_plugins
