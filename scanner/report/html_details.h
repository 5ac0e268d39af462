// SPDX-License-Identifier: MIT
// What the HTML report shows of one plug-in when its row is opened.
#pragma once

#include <string>

#include "scanner/events/result.h"

namespace scanner {

/// One element with everything that is known of it.
std::string htmlDetails(const PluginResult& result);

/// Whether it does not always end the same way: in the repetitions of this scan, or compared with an earlier
/// one.
bool endsDifferently(const PluginResult& result);

}  // namespace scanner
