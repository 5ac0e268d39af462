// SPDX-License-Identifier: MIT
// The six tests that every plug-in goes through.
//
//   0  inspect class info          names, category, pin properties, capabilities
//   1  inspect preset info         programs and their names
//   2  inspect parameter info      every parameter's value, texts and properties
//   3  testing setting states      sample rate, block size, state saved and loaded back, resume, bypass
//   4  inspect latency             tail size
//   5  inspect stream format       input/output variants and their speaker arrangements
//
// A test compares no results: the plug-in passes when it survives the requests. Tests keep no state and do
// not restore the plug-in's; they can run in any order and any number of times.
#pragma once

#include <vector>

#include "describe/variants.h"
#include "host/vst_wrapper.h"

/// Prints the step line of a test, then runs the test on an instance. Does nothing for a number outside 0 to
/// 5. Catches nothing. When `wrapper` is null, crashes the process on purpose after the step line.
void runOneTest(int testNumber, VSTWrapper* wrapper);

/// Calls setSpeakerArrangement() with the arrangements of each accepted variant, in list order. Test 5 passes
/// the result of BuildVariants(), in which no variant is accepted. Catches nothing.
void offerVariants(VSTWrapper& wrapper, const std::vector<VSTVariant>& variants);
