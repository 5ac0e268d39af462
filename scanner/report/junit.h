// SPDX-License-Identifier: MIT
// The report in the XML form of JUnit, which CI systems read. A pure function.
#pragma once

#include <string>
#include <string_view>

#include "scanner/events/result.h"

namespace scanner {

/// One test suite: the scan. One test case for each plug-in and child, in the order of the results: `classname` is the
/// bundle's folder, `name` the file's name and the child, `time` the seconds of the run.
///
/// - A result that is not wanted is a failure, one that could not be run an error. Its type is the verdict's
///   word; of a good verdict "flaky", "unexpected" or "findings".
/// - A skipped plug-in is skipped, with its reason.
/// - Whatever is wanted passes; system-out says so where the verdict is no good one (--expect, --baseline).
/// - system-out has the steps with their times and, at the step in which it came, what the plug-in printed.
///
/// A scan that did not come to its end has a further test case, which is an error: a CI system that reads nothing else
/// must not take it for a pass.
///
/// Each text is made valid for XML 1.0 (see xmlText()).
std::string junitReport(const ScanReport& report);

/// `text` without what XML 1.0 cannot hold: a byte that is no UTF-8 becomes U+FFFD, as do U+FFFE and U+FFFF;
/// other control characters than tabs and newlines become the like of "\x1b"; carriage returns become
/// newlines. What cannot be seen becomes "[U+202E]" and the like, so that no name looks like another.
std::string xmlText(std::string_view text);

}  // namespace scanner
