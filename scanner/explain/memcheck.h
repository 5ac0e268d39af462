// SPDX-License-Identifier: MIT
// valgrind's memcheck: its command line, and what it writes.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "scanner/events/result.h"

namespace scanner {

/// The files that memcheck writes for us: its errors, and where it has found which module.
constexpr const char* kMemcheckErrors = "memcheck.xml";
constexpr const char* kMemcheckLog = "memcheck.log";

/// The command that goes in front of the worker. With a folder it writes the two files there, without one it reports
/// to people.
std::vector<std::string> memcheckCommand(const std::string& valgrind, const std::string& folder = {});

/// Fills in findings, report and problem. `errors` and `log` are the contents of the two files, as far as memcheck
/// came. Errors of one kind that the plug-in reaches at one place are one finding. Leaks are none.
void readMemcheck(std::string_view errors, std::string_view log, Diagnosis& diagnosis);

}  // namespace scanner
