// SPDX-License-Identifier: MIT
// What a scan takes from earlier ones, and what it leaves to later ones.
#pragma once

#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "scanner/scan/options.h"
#include "scanner/store/store.h"

namespace scanner {

/// Where results are remembered: the file given with --cache, else the default; empty with "off", and where the
/// environment names no place.
std::string databaseFile(const std::string& cacheOption);

class Remembering {
 public:
  /// Opens the database, unless it is switched off. `say` gets sentences about what is wrong with it.
  Remembering(const ScanOptions& options, std::function<void(const std::string&)> say);

  /// A run whose result is known.
  struct Known {
    Run run;
    Remembered answer;
  };
  /// A run that has to be started.
  struct Unknown {
    Run run;
    double seconds = 0;  ///< How long it took the last time; 0 where that is not known.
  };
  struct Recollection {
    std::vector<Known> known;      ///< With the children of shells behind these.
    std::vector<Unknown> unknown;  ///< In the order of `runs`, with children of known shells among them.
    std::vector<NotRun> notRun;    ///< Children that the list skips.
  };
  /// Looks each run up. With --fresh nothing is known but how long runs took.
  Recollection recall(const std::vector<Run>& runs, const PluginList& skipped);

  /// The remembered result as today's: paths, command and comparison are of this scan. Nothing where it cannot
  /// be read after all.
  std::optional<PluginResult> resultOf(const Known& known);

  /// Compares a result with the last one of the same plug-in, unless there was no scan before this one. Called
  /// before save().
  void compareWithLast(PluginResult& result);

  void begin(const ScanStarted& scan);
  /// Remembers the result of a run that went to its end. `children` of a shell that could be described.
  void save(const PluginResult& result, const std::optional<std::vector<Child>>& children);
  void end(const ScanEnded& scan);

  double secondsOf(const Module& module);
  /// What a program says to --version: asked only when its file has changed since it was asked.
  std::string versionOf(const std::string& program);

 private:
  [[nodiscard]] Circumstances circumstancesOf(const Run& run);
  /// Fills in the event of a remembered result, read or, where it is only written again, unread. False where
  /// it is no longer there or not what the table says.
  bool fillFromEvent(PluginResult& result, const Known& known, bool isRead);
  /// What the tool said the last time; scans without it may lie between. `earlier`: the latest first.
  std::optional<Diagnosis> lastDiagnosis(const std::vector<Remembered>& earlier, const std::string& tool);
  void recall(const Run& run, const PluginList& skipped, Recollection& recollection);

  const ScanOptions& options;
  std::unique_ptr<Store> store;
  Circumstances common;                           ///< But for the file and the worker.
  std::map<std::string, std::string> identities;  ///< Of programs, by path.
  bool hasEarlierResults = false;
  std::map<std::string, std::size_t> changes;  ///< How often each was seen, by its word.
  std::size_t remembered = 0;
};

}  // namespace scanner
