// SPDX-License-Identifier: MIT
// The safety nets around the exit after a crash, by name.
//
// The program has all of them. A test builds it without one at a time (VSTTORTURE_WITHOUT=kTimer) and shows
// what a host would see then.
#pragma once

#ifndef VSTTORTURE_WITHOUT
#define VSTTORTURE_WITHOUT kNone
#endif

enum class SafetyNet {
  kNone,
  kSignalStack,      ///< Signal handlers of the main thread have a stack of their own.
  kExitNow,          ///< A second signal during the exit ends the process at once.
  kSecondSignal,     ///< No signal of ours stays blocked during the exit, so that a second one can arrive.
  kTimer,            ///< The exit takes a second at most.
  kClosedReport,     ///< No other thread prints a line any more.
  kDirectLastWords,  ///< "unexpected exit" is printed even when stdout's lock is held.
  kOwnProcess,       ///< A process that the plug-in has forked prints nothing.
};

/// False in the one variant of the program that is built without the net.
constexpr bool isEnabled(SafetyNet net) { return net != SafetyNet::VSTTORTURE_WITHOUT; }
