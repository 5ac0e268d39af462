// SPDX-License-Identifier: MIT
// The command line of vsttorture-scan.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "scanner/engine/run_engine.h"
#include "scanner/explain/explainer.h"
#include "scanner/plan/run_list.h"
#include "scanner/scan/whole_reports.h"

namespace CLI {
class App;
}

namespace scanner {

/// What the program ends with.
enum ScanStatus : int {
  kScanAsWanted = 0,     ///< Every plug-in ended as it should.
  kScanNotAsWanted = 1,  ///< One or more did not.
  kScanWrongUse = 2,     ///< Unknown options, no such path, no plug-in found.
  kScanCannotGoOn = 3,   ///< No worker, no scratch folder, results that could not be written.
  kScanInterrupted = 130,
};

struct ScanOptions {
  std::vector<std::string> paths = {};  ///< Empty: the default places.
  EngineOptions engine = {};
  unsigned repeat = 1;
  ExplainOptions explain = {};
  std::string skipFile = {};
  std::string expectFile = {};
  Shard shard = {};
  bool describes = false;
  std::string jsonFile = {};   ///< "-" for standard output.
  std::string cacheFile = {};  ///< Where results are remembered; empty for the default, "off" for nowhere.
  bool isFresh = false;        ///< Nothing is taken from earlier scans, but all is remembered.
  ReportFiles reports = {};
  std::string baselineFile = {};
  bool isQuiet = false;
  bool showsProgress = true;
  std::vector<std::string> workerFolders = {};  ///< Looked into before the usual ones.
};

/// Reads the command line. Where there is nothing to scan (--help, --version, a mistake) the options are
/// missing, the text is printed, and `status` is what to end with.
std::optional<ScanOptions> readOptions(int argc, const char* const* argv, int& status);

/// The options that scans and `vsttorture-scan report` share.
void addReportOptions(CLI::App& app, ReportFiles& reports, std::string& baselineFile);

/// Parses; false where that is all there is to do, as with --help or a mistake, which is printed.
bool parseCommandLine(CLI::App& app, int argc, const char* const* argv, int& status);

/// False, with a sentence printed, where more than one of them is to be written to standard output.
bool useStandardOutputOnce(const std::string& jsonFile, const ReportFiles& reports);

}  // namespace scanner
