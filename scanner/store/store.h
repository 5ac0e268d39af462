// SPDX-License-Identifier: MIT
// The results of earlier scans, in an SQLite database.
//
// docs/RESULTS_DATABASE.md describes the tables for their other readers. Any number of scans and readers may use
// one database at the same time. Each result is on disk, as far as other processes can see, when save() returns.
//
// Failures: none reaches the caller. A database that is damaged is renamed and a new one begun; one that is
//           locked, cannot be written to, was made by a newer version, or stands on a full disk is done without.
//           Whoever made the Store is told in one sentence each.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "scanner/events/result.h"
#include "scanner/store/remembered.h"

namespace scanner {

/// The database in the user's cache folder: XDG_CACHE_HOME where that is an absolute path, else .cache in HOME.
/// Either may be null. Empty where there is neither.
std::string defaultDatabase(const char* xdgCacheHome, const char* home);

/// The result as far as the table's columns tell it: its verdict, step, cause, when it began and how long it took.
PluginResult resultInShort(const Remembered& remembered);

class Store {
 public:
  /// Opens `file`, which is made where it is not there, as is its folder (mode 0700). `say` is called with each
  /// sentence, from any of the functions below.
  Store(const std::string& file, std::function<void(const std::string&)> say);
  ~Store();
  Store(const Store&) = delete;
  Store& operator=(const Store&) = delete;

  /// Whether results of earlier scans can be asked for.
  [[nodiscard]] bool canRead() const;

  // ---- What earlier scans have left --------------------------------------------------------------------

  /// Whether any scan has left a result.
  bool hasResults();
  /// The last results of a plug-in, the latest first.
  std::vector<Remembered> resultsOf(const std::string& bundle, const std::string& processor,
                                    const std::optional<std::int32_t>& child);
  /// The event of a result, without its newline; nothing where it is no longer there.
  std::optional<std::string> eventOf(std::int64_t id);
  /// How long the last run of the bundle itself took, in seconds; 0 where it was never run.
  double secondsOf(const std::string& bundle, const std::string& processor);
  /// What the program at `path` said to --version when its file had this identity.
  std::optional<std::string> versionOf(const std::string& path, const std::string& identity);

  // ---- What this scan leaves ---------------------------------------------------------------------------

  void beginScan(const ScanStarted& scan);
  /// `children` of a shell that could be described.
  void save(const PluginResult& result, const Circumstances& circumstances,
            const std::optional<std::vector<Child>>& children);
  void saveVersion(const std::string& path, const std::string& identity, const std::string& version);
  /// Also writes what could not be written before, because another program had locked the database. `changes` is
  /// how often each change was seen, by its word; `remembered` how many results were taken from earlier scans.
  void endScan(const ScanEnded& scan, const std::map<std::string, std::size_t>& changes,
               std::size_t remembered);

 private:
  struct Implementation;
  std::unique_ptr<Implementation> implementation;
};

}  // namespace scanner
