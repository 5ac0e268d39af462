// SPDX-License-Identifier: MIT
// "vsttorture-scan history": what earlier scans have found.
#pragma once

namespace scanner {

/// `argv` as main() gets it, with "history" as its second. Returns what the program ends with: kScanAsWanted,
/// kScanWrongUse where there is nothing of that name to show, kScanCannotGoOn where the database cannot be read.
int historyCommand(int argc, const char* const* argv);

}  // namespace scanner
