// SPDX-License-Identifier: MIT
// The safety nets around the way out, by name.
//
// The program spreads all of them. A test builds it without one at a time (VSTTORTURE_WITHOUT=kTimer) and
// shows what a host would see then.
#pragma once

#ifndef VSTTORTURE_WITHOUT
#define VSTTORTURE_WITHOUT kNone
#endif

enum class SafetyNet {
  kNone,
  kSignalStack,      ///< The main thread's handlers have a stack of their own.
  kEndAtOnce,        ///< A second signal on the way out ends the process at once.
  kSecondSignal,     ///< It can arrive at all: nothing stays blocked on the way out.
  kTimer,            ///< The way out takes a second at most.
  kClosedReport,     ///< No other thread prints a line any more.
  kDirectLastWords,  ///< The last words get past standard output's lock.
  kOwnProcess,       ///< A process that the plug-in has forked says nothing.
};

/// False in the one variant that lacks the net.
constexpr bool isSpread(SafetyNet net) { return net != SafetyNet::VSTTORTURE_WITHOUT; }
