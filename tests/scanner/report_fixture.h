// SPDX-License-Identifier: MIT
// Recorded scans for the tests of what reads and merges them.
#pragma once

#include <string>
#include <vector>

#include "scanner/events/recorded_stream.h"

/// A result as a scan gives it; not wanted where the verdict is not good.
inline scanner::PluginResult resultOf(const std::string& bundle, scanner::Verdict verdict, int step = 0) {
  scanner::PluginResult result;
  result.run.bundle = bundle;
  result.judgement.verdict = verdict;
  result.judgement.step = step;
  result.isWanted = scanner::rowOf(verdict).isGood;
  return result;
}

/// A scan that came to its end, by the machine "box".
inline scanner::RecordedScan scanOf(const std::string& source, std::vector<scanner::PluginResult> results,
                                    const scanner::Shard& shard = {}) {
  scanner::RecordedScan scan;
  scan.source = source;
  scan.report.started.machine = "box";
  scan.report.started.places = {"/lib"};
  scan.report.started.shard = shard;
  scan.report.started.plugins = results.size();
  scan.report.ended.emplace();
  for (const scanner::PluginResult& result : results) {
    if (!result.isWanted) ++scan.report.ended->unwanted;
  }
  scan.report.ended->status = scan.report.ended->unwanted > 0 ? 1 : 0;
  scan.report.results = std::move(results);
  return scan;
}
