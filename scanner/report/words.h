// SPDX-License-Identifier: MIT
// What several reports say of a result in the same words. Texts in them are not yet made fit for the form of
// the report.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "scanner/events/result.h"

namespace scanner {

/// The last part of a path.
std::string fileName(const std::string& path);

/// "crashed at 5"; the verdict alone where there was no step, and where it is a good one: that came after the
/// last step.
std::string endInWords(const std::string& verdict, const std::optional<int>& step, const char* at = " at ");

/// "2 of 3 passed, 1 of 3 exited at 4"
std::string endsInWords(const Repetitions& repetitions);

/// "new", "mended", "still failing", "flaky"; empty for no change worth a word.
std::string changeWord(Comparison::Change change);

/// What has changed, in a sentence that begins with changeWord(); empty for nothing.
std::string changeInWords(const PluginResult& result);

/// In one line what makes it a failure, all there is: its repetitions, what was expected, its cause, what a
/// tool has found. Empty where nothing is known but its verdict.
std::string whyNotWanted(const PluginResult& result);

/// "640 ns", "0.6 ms", "38 ms", "1.2 s", "2 min 5 s", "1 h 2 min"; "0 s" for what is not above 0.
std::string durationInWords(double seconds);

/// "1 file", "2 files".
std::string countInWords(std::uint64_t count, std::string_view thing);

/// Why not every result is there, in a sentence; empty where all are, as far as the report says.
std::string incompleteness(const ScanReport& report);

}  // namespace scanner
