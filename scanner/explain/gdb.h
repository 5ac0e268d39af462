// SPDX-License-Identifier: MIT
// gdb: what it is told to do for a verdict, and what it says then.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "scanner/events/result.h"

namespace scanner {

/// The file that gdb writes for us. What the plug-in prints is not in it.
constexpr const char* kGdbLog = "gdb.log";

/// Whether gdb can stop where a run with this verdict goes wrong; `whyNot` is a sentence where it cannot, and empty
/// where there is nothing wrong.
bool canStopAt(const Judgement& judgement, std::string& whyNot);

/// The command that goes in front of the worker: stops it where the run goes wrong in this way, and prints where that
/// is. With a folder its log is written there, without one it reports to people. A run that hangs is stopped by
/// SIGINT to gdb.
std::vector<std::string> gdbCommand(const std::string& gdb, const Judgement& judgement,
                                    const std::string& folder = {});

/// Fills in findings, report and problem from gdb's log.
void readGdb(std::string_view log, const Judgement& judgement, Diagnosis& diagnosis);

}  // namespace scanner
