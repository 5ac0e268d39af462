// SPDX-License-Identifier: MIT
// What the programs that run the torture test do behind their command lines.
#pragma once

#include <string>
#include <vector>

#include "driver/exit_status.h"
#include "loader/plugin_identity.h"

/// The child that an argument selects. Text that is not a number selects child 0; hasChildID is still true.
VST_loadID childNamed(const char* argument);

/// Refuses the bundle or runs the test, and gives the status for main() to return. The report must be open
/// and the crash guard be armed. `tests`: null for the full plan, else those to run.
ExitStatus tryOutPlugin(const std::string& path, const VST_loadID& loadID,
                        const std::vector<int>* tests = nullptr);
