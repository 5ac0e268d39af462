// SPDX-License-Identifier: MIT
// The report as one HTML file for people: no network, readable without scripts, sorted and filtered with them.
//
// The page's style and script are those of scanner/report/html/; a Content-Security-Policy admits these two and
// nothing else. Results are elements and texts only, never part of a script, a style or a link's target, and
// every text goes through escaped().
#pragma once

#include <string>

#include "scanner/events/result.h"

namespace scanner {

/// The whole page. Failures come first, what is new among them before what is not.
std::string htmlReport(const ScanReport& report);

}  // namespace scanner
