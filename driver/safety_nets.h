// SPDX-License-Identifier: MIT
// The names of the safety nets around the exit after a crash.
//
// The program has all of them. A test builds it without one at a time (VSTTORTURE_WITHOUT=kTimer) and checks
// what a host sees then.
#pragma once

#ifndef VSTTORTURE_WITHOUT
#define VSTTORTURE_WITHOUT kNone
#endif

enum class SafetyNet {
  kNone,
  kSignalStack,      ///< Signal handlers of the main thread have a stack of their own.
  kExitNow,          ///< A second signal during the exit ends the process at once.
  kSecondSignal,     ///< No signal of ours stays blocked during the exit, so that a second one can arrive.
  kTimer,            ///< The exit takes at most one second.
  kClosedReport,     ///< No other thread prints a line during the exit.
  kDirectLastWords,  ///< "unexpected exit" is printed even when stdout's lock is held.
  kOwnProcess,       ///< A process that the plug-in has forked prints nothing.
};

/// False in the one variant of the program that is built without the net.
constexpr bool isEnabled(SafetyNet net) { return net != SafetyNet::VSTTORTURE_WITHOUT; }
