// SPDX-License-Identifier: MIT
// Makes one report of the recorded scans of several machines. Pure functions.
#pragma once

#include <string>
#include <vector>

#include "scanner/events/recorded_stream.h"
#include "scanner/events/result.h"

namespace scanner {

struct MergedReport {
  /// Results in order of bundle, child and processor, each plug-in once; the notes of all scans and `problems`. Its
  /// end is there even if those of all scans are missing.
  ScanReport report;
  /// Sentences: the same plug-in in two scans, parts that are missing, scans that were cut off or interrupted, scans
  /// that cannot be compared well.
  std::vector<std::string> problems;
  /// Whether every result is there. If not, the report's status is 1 whatever the results are.
  bool isWhole = true;
};

/// Merges the scans, of which there must be one at least. The parts of a scan make the report that one machine would
/// have made, times aside.
///
/// Of two results of the same plug-in the worse is taken: one that is not wanted rather than one that is, then the
/// worse verdict.
MergedReport merge(std::vector<RecordedScan> scans);

/// By bundle, child (none first) and processor.
void sortResults(std::vector<PluginResult>& results);

/// Counts the results again and sets the report's status, after they have been changed.
void conclude(MergedReport& merged);

}  // namespace scanner
