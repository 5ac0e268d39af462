// SPDX-License-Identifier: MIT
// The reports that are written when a scan is over, since they need all of its results.
#pragma once

#include <string>
#include <vector>

#include "scanner/events/result.h"

namespace scanner {

/// Which of them are wanted: each the file to write, "-" for standard output, empty for none.
struct ReportFiles {
  std::string junit = {};
  std::string html = {};

  [[nodiscard]] bool areWanted() const { return !junit.empty() || !html.empty(); }
  [[nodiscard]] bool useStandardOutput() const { return junit == "-" || html == "-"; }
};

/// Writes those that are wanted. Returns a sentence for each that could not be.
std::vector<std::string> writeReports(const ReportFiles& files, const ScanReport& report);

/// The results of a scan that goes on. Nothing is kept where no report is wanted.
class WholeReports {
 public:
  explicit WholeReports(const ReportFiles& files_) : files(files_) {}

  [[nodiscard]] bool areWanted() const { return files.areWanted(); }
  void begin(const ScanStarted& started);
  void add(const PluginResult& result);
  /// What is known at the end only.
  void addNote(const std::string& note);
  /// Writes them. Returns what writeReports() returns.
  std::vector<std::string> finish(const ScanEnded& ended);

 private:
  ReportFiles files;
  ScanReport report;
};

}  // namespace scanner
