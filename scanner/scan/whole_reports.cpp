// SPDX-License-Identifier: MIT
#include "scanner/scan/whole_reports.h"

#include <stdexcept>

#include "scanner/report/html.h"
#include "scanner/report/junit.h"
#include "scanner/report/merge.h"
#include "scanner/scan/whole_file.h"

namespace scanner {
namespace {

/// One report: the file that it goes to, and the function that makes it.
struct ReportKind {
  std::string ReportFiles::*file;
  std::string (*make)(const ScanReport& report);
};

constexpr ReportKind kReportKinds[] = {
    {&ReportFiles::junit, junitReport},
    {&ReportFiles::html, htmlReport},
};

}  // namespace

std::vector<std::string> writeReports(const ReportFiles& files, const ScanReport& report) {
  std::vector<std::string> problems;
  for (const ReportKind& kind : kReportKinds) {
    const std::string& name = files.*kind.file;
    if (name.empty()) continue;
    try {
      WholeFile file(name);
      file.write(kind.make(report));
      file.finish();
    } catch (const std::runtime_error& error) {
      problems.emplace_back(error.what());
    }
  }
  return problems;
}

void WholeReports::begin(const ScanStarted& started) {
  if (areWanted()) report.started = started;
}

void WholeReports::add(const PluginResult& result) {
  if (areWanted()) report.results.push_back(result);
}

void WholeReports::addNote(const std::string& note) {
  if (areWanted()) report.started.notes.push_back(note);
}

std::vector<std::string> WholeReports::finish(const ScanEnded& ended) {
  if (!areWanted()) return {};
  report.ended = ended;
  sortResults(report.results);
  return writeReports(files, report);
}

}  // namespace scanner
