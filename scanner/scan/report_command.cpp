// SPDX-License-Identifier: MIT
#include "scanner/scan/report_command.h"

#include <algorithm>
#include <csignal>
#include <cstdio>
#include <optional>
#include <stdexcept>
#include <utility>

#include <CLI/CLI.hpp>
#include <unistd.h>

#include "scanner/events/event_json.h"
#include "scanner/events/recorded_stream.h"
#include "scanner/plan/plugin_list.h"
#include "scanner/report/merge.h"
#include "scanner/report/terminal.h"
#include "scanner/scan/baseline_file.h"
#include "scanner/scan/options.h"
#include "scanner/scan/text_output.h"
#include "scanner/scan/whole_file.h"
#include "scanner/scan/whole_reports.h"

namespace scanner {
namespace {

constexpr const char* kDescription =
    "Makes reports of recorded scans: of one, or of the parts of a scan that several machines made.\n"
    "FILE is what --json wrote; - is standard input.";

constexpr const char* kFooter =
    "Status: 0 every plug-in as wanted, 1 not, or results are missing, 2 wrong use, or a FILE is no such\n"
    "record, 3 a report could not be written.";

struct ReportOptions {
  std::vector<std::string> files = {};
  std::string jsonFile = {};
  ReportFiles reports = {};
  std::string baselineFile = {};
  bool isQuiet = false;
};

std::optional<ReportOptions> readReportOptions(int argc, const char* const* argv, int& status) {
  ReportOptions options;
  CLI::App app(kDescription, "vsttorture-scan report");
  app.footer(kFooter);
  app.add_option("FILE", options.files, "Recorded event streams")->required()->type_name("");
  app.add_option("--json", options.jsonFile, "Write the merged events; - is standard output")
      ->type_name("FILE");
  addReportOptions(app, options.reports, options.baselineFile);
  app.add_flag("--quiet", options.isQuiet, "No line for a plug-in that ended as it should");
  if (!parseCommandLine(app, argc, argv, status)) return std::nullopt;
  if (!useStandardOutputOnce(options.jsonFile, options.reports)) {
    status = kScanWrongUse;
    return std::nullopt;
  }
  if (std::count(options.files.begin(), options.files.end(), "-") > 1) {
    complain("standard input can be read once only");
    status = kScanWrongUse;
    return std::nullopt;
  }
  return options;
}

MergedReport readAll(const ReportOptions& options) {
  std::vector<RecordedScan> scans;
  std::vector<std::string> problems;
  for (const std::string& file : options.files) {
    RecordedStream stream = readStream(file);
    std::move(stream.scans.begin(), stream.scans.end(), std::back_inserter(scans));
    problems.insert(problems.end(), stream.problems.begin(), stream.problems.end());
  }
  MergedReport merged = merge(std::move(scans));
  // A line that is no event may have been a result.
  if (!problems.empty()) merged.isWhole = false;
  std::vector<std::string>& notes = merged.report.started.notes;
  notes.insert(notes.end(), problems.begin(), problems.end());
  merged.problems.insert(merged.problems.end(), problems.begin(), problems.end());
  return merged;
}

void compareWithBaseline(MergedReport& merged, const std::string& file) {
  ScanStarted& started = merged.report.started;
  std::vector<std::string> notes;
  Baseline baseline = readBaseline(file, notes);
  std::vector<Run> runs;
  for (const PluginResult& result : merged.report.results) runs.push_back(result.run);
  baseline.locate(runs);
  std::vector<PluginKey> now;
  for (PluginResult& result : merged.report.results) {
    baseline.apply(result);
    now.push_back(keyOf(result.run));
  }
  const std::vector<std::string> gone = goneInWords(baseline.gone(now, started.places, started.shard));
  notes.insert(notes.end(), gone.begin(), gone.end());
  started.notes.insert(started.notes.end(), notes.begin(), notes.end());
  merged.problems.insert(merged.problems.end(), notes.begin(), notes.end());
}

/// Writes the report as an event stream. Returns a sentence where it could not.
std::string writeEvents(const std::string& name, const ScanReport& report) {
  if (name.empty()) return "";
  try {
    WholeFile file(name);
    file.write(eventLine(report.started));
    for (const PluginResult& result : report.results) file.write(eventLine(result));
    file.write(eventLine(*report.ended));
    file.finish();
    return "";
  } catch (const std::runtime_error& error) {
    return error.what();
  }
}

/// For the terminal, where standard error is seen as well.
ScanStarted withoutNotes(ScanStarted started, const std::vector<std::string>& others) {
  const auto isOther = [&others](const std::string& note) {
    return std::find(others.begin(), others.end(), note) != others.end();
  };
  started.notes.erase(std::remove_if(started.notes.begin(), started.notes.end(), isOther),
                      started.notes.end());
  return started;
}

int reportOn(const ReportOptions& options) {
  MergedReport merged = readAll(options);
  if (!options.baselineFile.empty()) compareWithBaseline(merged, options.baselineFile);
  conclude(merged);
  const ScanReport& report = merged.report;

  const bool usesStandardOutput = options.jsonFile == "-" || options.reports.useStandardOutput();
  TextOutput output(usesStandardOutput ? STDERR_FILENO : STDOUT_FILENO);
  ScanOptions forTerminal;
  forTerminal.isQuiet = options.isQuiet;
  TerminalReport terminal(terminalOptions(forTerminal, output.descriptor),
                          [&output](const std::string& text) { return output.write(text); });
  terminal.started(withoutNotes(report.started, merged.problems));
  for (const PluginResult& result : report.results) terminal.ended(result);
  terminal.ended(*report.ended);

  std::vector<std::string> problems = writeReports(options.reports, report);
  if (std::string problem = writeEvents(options.jsonFile, report); !problem.empty())
    problems.push_back(problem);
  if (output.hasFailed) problems.push_back(output.reason);
  for (const std::string& problem : merged.problems) complain(problem);
  for (const std::string& problem : problems) complain("a report could not be written: " + problem);
  return problems.empty() ? report.ended->status : kScanCannotGoOn;
}

}  // namespace

int reportCommand(int argc, const char* const* argv) {
  std::signal(SIGPIPE, SIG_IGN);  // A reader that has gone is a write that fails.
  int status = kScanAsWanted;
  const std::optional<ReportOptions> options = readReportOptions(argc, argv, status);
  if (!options) return status;
  try {
    return reportOn(*options);
  } catch (const std::exception& error) {
    complain(error.what());
    return kScanWrongUse;
  }
}

}  // namespace scanner
