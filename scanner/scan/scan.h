// SPDX-License-Identifier: MIT
// A scan: find, plan, run, judge, report.
#pragma once

#include "scanner/scan/options.h"

namespace scanner {

/// Scans, writes all reports, and returns what the program ends with (ScanStatus).
int scan(const ScanOptions& options);

}  // namespace scanner
