// SPDX-License-Identifier: MIT
// The torture run of one plug-in, from loading the bundle to the result.
#pragma once

#include <string>
#include <vector>

#include "loader/plugin_identity.h"

/// Runs the whole test on the bundle at `path`, or on its child that `loadID` names, and prints the run's
/// lines. True when every phase ran to its end, false after a failure line. `isShellPlugin` receives whether
/// the plug-in is a shell. Crashes the process on purpose when the plug-in yields no instance.
bool RunVSTTortureTest(const std::string& path, const VST_loadID& loadID, bool& isShellPlugin);

/// The same with other tests: those of the list, in its order, on the first instance. A shell is run as ever.
bool runListedTests(const std::string& path, const VST_loadID& loadID, const std::vector<int>& tests,
                    bool& isShellPlugin);
