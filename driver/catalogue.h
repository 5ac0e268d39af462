// SPDX-License-Identifier: MIT
// The six tests that every plug-in goes through.
//
//   0  inspect class info          names, category, pin properties, capabilities
//   1  inspect preset info         programs and their names
//   2  inspect parameter info      every parameter's value, texts and properties
//   3  testing setting states      sample rate, block size, data saved and loaded back, on, bypass, off
//   4  inspect latency             tail size
//   5  inspect stream format       input/output variants and their speaker arrangements
//
// A test compares nothing: the plug-in passes when it survives. Tests keep no state and leave the plug-in as
// the calls left it; they run in any order, any number of times.
#pragma once

#include "host/vst_wrapper.h"

/// Announces a test and runs it on an instance. A number outside 0 to 5 does nothing at all. Catches nothing.
/// Without an instance the process crashes on purpose once the test is announced.
void runOneTest(int testNumber, VSTWrapper* wrapper);
