// SPDX-License-Identifier: MIT
#include "scanner/scan/history_command.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <limits>

#include <CLI/CLI.hpp>
#include <fmt/format.h>
#include <unistd.h>

#include "scanner/judge/verdict.h"
#include "scanner/report/terminal.h"
#include "scanner/report/words.h"
#include "scanner/scan/options.h"
#include "scanner/scan/remembering.h"
#include "scanner/scan/text_output.h"
#include "scanner/store/history.h"
#include "scanner/store/open_database.h"
#include "scanner/store/schema.h"

namespace scanner {
namespace {

constexpr std::size_t kScansShown = 20;
/// Below so many columns the verdicts do not stand below each other.
constexpr std::size_t kNarrow = 60;

int endWith(ScanStatus status, const std::string& sentence) {
  complain(sentence);
  return status;
}

/// The local time, to the minute.
std::string timeInWords(double seconds) {
  const auto time = static_cast<std::time_t>(seconds);
  std::tm parts = {};
  char text[32] = "";
  if (localtime_r(&time, &parts) != nullptr) std::strftime(text, sizeof text, "%Y-%m-%d %H:%M", &parts);
  return text;
}

/// "197 passed, 3 crashed", in the order of the verdicts.
std::string countsInWords(const std::map<std::string, std::size_t>& counts) {
  std::string text;
  for (const std::string& word : verdictWords()) {
    const auto found = counts.find(word);
    if (found != counts.end()) text += fmt::format("{}{} {}", text.empty() ? "" : ", ", found->second, word);
  }
  return text.empty() ? "no results" : text;
}

/// "; 1 new, 2 mended", or nothing.
std::string changesInWords(const std::map<std::string, std::size_t>& changes) {
  using Change = Comparison::Change;
  std::string text;
  for (const Change change : {Change::kNew, Change::kMended, Change::kStillFailing, Change::kFlaky}) {
    const auto found = changes.find(nameOfChange(change));
    if (found != changes.end())
      text += fmt::format("{}{} {}", text.empty() ? "; " : ", ", found->second, changeWord(change));
  }
  return text;
}

/// How many columns a line may have: any number in a file or a pipe.
std::size_t columns() {
  return isatty(STDOUT_FILENO) != 0 ? textColumns(STDOUT_FILENO) : std::numeric_limits<std::size_t>::max();
}

/// A line, broken where the terminal ends; what follows is indented by `indent`.
void print(const std::string& line, std::size_t indent) {
  std::printf("%s\n", wrapped(printable(line), columns(), indent).c_str());
}

void printScans(const std::vector<EarlierScan>& scans) {
  for (const EarlierScan& scan : scans) {
    const char* end = !scan.hasEnded ? "; did not end" : scan.isInterrupted ? "; interrupted" : "";
    print(fmt::format("{}  {}  {}  {}{}{}", timeInWords(scan.time), scan.machine, scan.toolVersion,
                      countsInWords(scan.counts), changesInWords(scan.changes), end),
          2);
  }
}

void printResults(const std::vector<EarlierResult>& results) {
  std::string last;
  for (const EarlierResult& result : results) {
    std::string name = nameOf({result.bundle, result.child, result.childName}, true);
    // The processor tells the modules of one bundle apart.
    if (!result.processor.empty()) name += " (" + result.processor + ")";
    const std::string key = fmt::format("{}\n{}\n{}", result.bundle, result.processor,
                                        result.child ? std::to_string(*result.child) : "");
    if (key != last) print(name, 2);
    last = key;
    const bool isNarrow = columns() < kNarrow;
    print(fmt::format("  {}  {:<{}} {:>{}}  {}{}{}", timeInWords(result.time), result.verdict,
                      isNarrow ? 0 : 12, durationInWords(result.wallSeconds), isNarrow ? 0 : 9,
                      result.toolVersion, result.isFlaky ? "  flaky" : "",
                      result.cause.empty() ? "" : "  " + result.cause),
          4);
  }
}

/// A path that is there is looked for from the root, any other text as it is.
std::string nameToLookFor(const std::string& given) {
  std::error_code error;
  if (!std::filesystem::exists(given, error)) return given;
  std::string path = std::filesystem::absolute(given, error).lexically_normal().string();
  while (path.size() > 1 && path.back() == '/') path.pop_back();
  return path;
}

int show(const std::string& file, const std::string& plugin) {
  History history(file);
  if (plugin.empty()) {
    const std::vector<EarlierScan> scans = history.lastScans(kScansShown);
    if (scans.empty()) return endWith(kScanWrongUse, file + " holds no scan yet");
    printScans(scans);
    return kScanAsWanted;
  }
  const std::vector<EarlierResult> results = history.resultsOf(nameToLookFor(plugin));
  if (results.empty())
    return endWith(kScanWrongUse,
                   fmt::format("no result of a plug-in called \"{}\" is remembered in {}", plugin, file));
  printResults(results);
  return kScanAsWanted;
}

/// The status, unless standard output could not take all of it.
int afterPrinting(int status) {
  if (std::fflush(stdout) == 0 && std::ferror(stdout) == 0) return status;
  return endWith(kScanCannotGoOn, std::string("standard output: ") + std::strerror(errno));
}

}  // namespace

int historyCommand(int argc, const char* const* argv) {
  std::string cache;
  std::string plugin;
  CLI::App app("Shows the last scans, or the results of one plug-in over time.", "vsttorture-scan history");
  app.footer(
      "Status: 0 something was shown, 2 wrong use or nothing to show, 3 the database cannot be read.\n"
      "A plug-in named \"history\" is scanned as ./history.");
  app.add_option("PLUG-IN", plugin, "A path, or a part of one")->type_name("");
  app.add_option("--cache", cache, "The database, instead of the one in the user's cache folder")
      ->type_name("FILE");
  int status = kScanAsWanted;
  if (!parseCommandLine(app, argc - 1, argv + 1, status)) return status;
  const std::string file = databaseFile(cache);
  if (file.empty())
    return endWith(kScanWrongUse,
                   "there is no database: neither XDG_CACHE_HOME nor HOME is set, or it is off");
  if (!isThere(file, false)) return endWith(kScanWrongUse, "nothing is remembered yet: there is no " + file);
  try {
    return afterPrinting(show(file, plugin));
  } catch (const NotOurDatabase& error) {
    return endWith(kScanCannotGoOn, file + " " + error.what());
  } catch (const DatabaseError& error) {
    return endWith(kScanCannotGoOn, file + " cannot be read: " + reasonInWords(error));
  }
}

}  // namespace scanner
