// SPDX-License-Identifier: MIT
// vsttorture-scan report: makes reports of recorded scans.
#pragma once

namespace scanner {

/// Reads the command line behind "report", whose first argument is that word, does what it says, and returns what the
/// program ends with (ScanStatus): 0 when every result is as wanted and none is missing, 1 otherwise, 2 for wrong use
/// and files that are no event streams, 3 when a report could not be written.
int reportCommand(int argc, const char* const* argv);

}  // namespace scanner
