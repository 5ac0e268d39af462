// SPDX-License-Identifier: MIT
// What the process ends with.
#pragma once

enum ExitStatus : int {
  kExitPassed = 0,            ///< The run went to its end.
  kExitShell = 1,             ///< The same, and the plug-in is a shell.
  kExitNoPath = 2,            ///< No bundle was named.
  kExitFailed = 3,            ///< The run stopped at a failure, which has its line.
  kExitRefusedUnmatched = 4,  ///< Refused, with the check's out-flag false. No row of the list does this.
  kExitRefused = 5,           ///< The bundle is on the list of those that are refused.
  kExitCrashed = 7,           ///< The crash guard ended the process.
};
