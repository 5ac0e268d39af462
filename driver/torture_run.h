// SPDX-License-Identifier: MIT
// The torture run of one plug-in: its frame from loading to the verdict.
#pragma once

#include <string>

#include "loader/plugin_identity.h"

/// Runs the whole test on the bundle at `path`, and in it on the child that `loadID` names. Prints the lines
/// of the run. True when every phase ran to its end; false after a failure line. `isShellPlugin` becomes true
/// for a shell, else false. A plug-in that yields no instance crashes the process on purpose.
bool RunVSTTortureTest(const std::string& path, const VST_loadID& loadID, bool& isShellPlugin);
