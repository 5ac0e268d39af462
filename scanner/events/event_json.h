// SPDX-License-Identifier: MIT
// Events as JSON, one object a line, in the form of docs/schema/scan-events.schema.json.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "scanner/events/result.h"

namespace scanner {

/// Of the events; the member "format" of scan_started. Another number for a change that readers notice.
inline constexpr int kEventFormat = 1;

/// In bytes. A result whose description would make its line longer is written without it.
inline constexpr std::size_t kLongestEventLine = std::size_t{16} << 20;

/// Each is one line with its newline. Texts that are not valid UTF-8 (names of files, what a plug-in prints) are
/// made so: a byte that cannot stay becomes U+FFFD.
std::string eventLine(const ScanStarted& started);
std::string eventLine(const Run& runStarted);
std::string eventLine(const PluginResult& result);
std::string eventLine(const ScanEnded& ended);

/// The value of the member "plugin" of an event.
std::string pluginText(const Run& run);

/// `bytes` with U+FFFD for each byte that is not part of valid UTF-8.
std::string validUtf8(std::string_view bytes);

}  // namespace scanner
