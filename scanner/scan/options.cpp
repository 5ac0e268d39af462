// SPDX-License-Identifier: MIT
#include "scanner/scan/options.h"

#include <charconv>
#include <cmath>
#include <cstdio>
#include <cstdlib>

#include <CLI/CLI.hpp>

#include "scanner/system/system.h"

namespace scanner {
namespace {

constexpr const char* kDescription =
    "Tortures VST 2.x plug-ins, each in a process of its own, and says which of them fail, where and why.\n"
    "Without a path: the folders in VST_PATH, else those in which hosts look for plug-ins.\n"
    "vsttorture-scan history --help: results of earlier scans.\n"
    "vsttorture-scan report --help: reports of recorded scans.";

constexpr const char* kFooter =
    "Status: 0 every plug-in as wanted, 1 not, 2 wrong use, 3 the scan could not go on, 130 interrupted.\n"
    "vsttorture-scan(1) says what the lists look like; VERDICTS.md says what each verdict means.";

/// "K/N": digits, a slash, digits.
std::optional<Shard> readShard(const std::string& text) {
  Shard shard;
  const char* const end = text.data() + text.size();
  const auto [slash, partError] = std::from_chars(text.data(), end, shard.part);
  if (partError != std::errc() || slash == end || *slash != '/') return std::nullopt;
  const auto [rest, partsError] = std::from_chars(slash + 1, end, shard.parts);
  if (partsError != std::errc() || rest != end || shard.part < 1 || shard.part > shard.parts)
    return std::nullopt;
  return shard;
}

std::string checkShard(const std::string& text) {
  return readShard(text) ? "" : "\"" + text + "\" is not K/N, with K from 1 to N";
}

std::string checkSeconds(const std::string& text) {
  char* end = nullptr;
  const double seconds = std::strtod(text.c_str(), &end);
  const bool isNumber = !text.empty() && *end == '\0' && std::isfinite(seconds);
  return isNumber && seconds > 0 ? "" : "\"" + text + "\" is no number of seconds above 0";
}

/// A whole number, of which the help does not say the range.
CLI::Validator fromTo(int least, int most) { return CLI::Range(least, most).description(""); }

}  // namespace

std::optional<ScanOptions> readOptions(int argc, const char* const* argv, int& status) {
  ScanOptions options;
  options.engine.jobs = system::usableProcessors();
  Limits& limits = options.engine.limits;
  std::uint64_t memoryInMiB = limits.memoryInBytes >> 20;
  std::string shard;
  std::string sandbox = "auto";
  std::string under;
  bool hidesProgress = false;

  CLI::App app(kDescription, "vsttorture-scan");
  app.footer(kFooter);
  app.set_version_flag("--version", "vsttorture-scan " VSTTORTURE_VERSION, "Print the version and end");
  app.add_option("PATH", options.paths, "Plug-ins, and folders that are searched for plug-ins")
      ->type_name("");
  app.add_option("-j,--jobs", options.engine.jobs, "How many run at a time")
      ->check(fromTo(1, 1024))
      ->type_name("N")
      ->capture_default_str();
  app.add_option("--step-limit", limits.stepInSeconds, "Seconds that one step may take")
      ->check(checkSeconds)
      ->type_name("SECONDS")
      ->capture_default_str();
  app.add_option("--limit", limits.runInSeconds, "Seconds that a whole run may take")
      ->check(checkSeconds)
      ->type_name("SECONDS")
      ->capture_default_str();
  app.add_option("--memory", memoryInMiB, "MiB of memory that a run may use")
      ->check(fromTo(1, 1 << 30))
      ->type_name("MIB")
      ->capture_default_str();
  app.add_option("--repeat", options.repeat,
                 "Run each plug-in N times, from the second time on with other contents of fresh memory")
      ->check(fromTo(1, 10000))
      ->type_name("N");
  app.add_option("--under", under, "Run each plug-in once more under memcheck, gdb or a COMMAND")
      ->type_name("TOOL");
  app.add_flag("--shrink", options.explain.shrinks, "Find the shortest list of tests that still fails");
  app.add_option("--skip", options.skipFile, "Do not run the plug-ins in this list")->type_name("FILE");
  app.add_option("--expect", options.expectFile, "How each plug-in is expected to end")->type_name("FILE");
  app.add_option("--shard", shard, "Only part K of N of the plug-ins")->check(checkShard)->type_name("K/N");
  app.add_option("--sandbox", sandbox,
                 "Confine plug-ins in bubblewrap: auto (where that works), required or off")
      ->check(CLI::IsMember({"auto", "required", "off"}).description(""))
      ->type_name("WHEN")
      ->capture_default_str();
  app.add_flag("--describe", options.describes, "Add each plug-in's description to its result");
  app.add_flag("--display", options.engine.keepDisplay, "Let plug-ins see the display (DISPLAY)");
  app.add_option("--cache", options.cacheFile,
                 "Remember results in this file; off: nowhere. Without it: in the user's cache folder")
      ->type_name("FILE");
  app.add_flag("--fresh", options.isFresh, "Run again what is remembered");
  app.add_option("--json", options.jsonFile, "Write each event as one line of JSON; - is standard output")
      ->type_name("FILE");
  addReportOptions(app, options.reports, options.baselineFile);
  app.add_flag("--quiet", options.isQuiet, "No line for a plug-in that ended as it should");
  app.add_flag("--no-progress", hidesProgress, "No progress line");
  app.add_option("--workers", options.workerFolders, "Look for vsttorture-worker in this folder first")
      ->type_name("FOLDER")
      ->allow_extra_args(false);  // What follows is a path again.

  if (!parseCommandLine(app, argc, argv, status)) return std::nullopt;
  if (!useStandardOutputOnce(options.jsonFile, options.reports)) {
    status = kScanWrongUse;
    return std::nullopt;
  }
  try {
    if (app.count("--under") > 0) options.explain.tool = findTool(under);
  } catch (const UnusableTool& error) {
    std::fprintf(stderr, "vsttorture-scan: %s\n", error.what());
    status = kScanWrongUse;
    return std::nullopt;
  }
  limits.memoryInBytes = memoryInMiB << 20;
  if (!shard.empty()) options.shard = *readShard(shard);
  options.engine.sandbox = sandbox == "off"        ? SandboxUse::kOff
                           : sandbox == "required" ? SandboxUse::kRequired
                                                   : SandboxUse::kAuto;
  options.showsProgress = !hidesProgress;
  return options;
}

void addReportOptions(CLI::App& app, ReportFiles& reports, std::string& baselineFile) {
  app.add_option("--junit", reports.junit,
                 "Write a JUnit report, for CI systems, at the end; - is standard output")
      ->type_name("FILE");
  app.add_option("--html", reports.html,
                 "Write a report as one HTML page, for a browser, at the end; - is standard output")
      ->type_name("FILE");
  app.add_option("--baseline", baselineFile,
                 "Only what is new compared with this record of --json is a failure")
      ->type_name("FILE");
}

bool parseCommandLine(CLI::App& app, int argc, const char* const* argv, int& status) {
  try {
    app.parse(argc, argv);
    return true;
  } catch (const CLI::ParseError& error) {
    const bool isQuestion = error.get_exit_code() == static_cast<int>(CLI::ExitCodes::Success);
    if (isQuestion) {
      app.exit(error);
    } else {
      std::fprintf(stderr, "vsttorture-scan: %s\n%s --help says what there is.\n", error.what(),
                   app.get_name().c_str());
    }
    status = isQuestion ? kScanAsWanted : kScanWrongUse;
    return false;
  }
}

bool useStandardOutputOnce(const std::string& jsonFile, const ReportFiles& reports) {
  const int uses = (jsonFile == "-" ? 1 : 0) + (reports.junit == "-" ? 1 : 0) + (reports.html == "-" ? 1 : 0);
  if (uses <= 1) return true;
  std::fprintf(stderr, "vsttorture-scan: only one report can go to standard output\n");
  return false;
}

}  // namespace scanner
