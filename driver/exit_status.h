// SPDX-License-Identifier: MIT
// The exit statuses of the process.
#pragma once

enum ExitStatus : int {
  kExitPassed = 0,            ///< The run was completed.
  kExitShell = 1,             ///< The same, and the plug-in is a shell.
  kExitNoPath = 2,            ///< No path was given.
  kExitFailed = 3,            ///< The run stopped at a failure and printed its line.
  kExitRefusedUnmatched = 4,  ///< Refused, but `matched` was left false. Never happens.
  kExitRefused = 5,           ///< The bundle is on the list of refused bundles.
  kExitCrashed = 7,           ///< The crash guard ended the process.
};
