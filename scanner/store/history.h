// SPDX-License-Identifier: MIT
// What the database of results says about earlier scans.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "scanner/store/database.h"

namespace scanner {

struct EarlierScan {
  double time = 0;  ///< When it began, in seconds since 1970.
  std::string machine;
  std::string toolVersion;
  bool hasEnded = false;  ///< False for one that was killed, or that is under way.
  bool isInterrupted = false;
  std::size_t remembered = 0;  ///< Results that it took from earlier scans.
  std::map<std::string, std::size_t> counts =
      {};  ///< By the verdict's word; of one that has not ended, so far.
  std::map<std::string, std::size_t> changes = {};  ///< By the word of nameOfChange().
};

struct EarlierResult {
  std::string bundle;  ///< Bytes.
  std::string processor;
  std::optional<std::int32_t> child = {};
  std::string childName = {};
  double time = 0;  ///< When the run began, in seconds since 1970.
  double wallSeconds = 0;
  std::string verdict;  ///< The word.
  bool isFlaky = false;
  std::string cause;
  std::string toolVersion;
};

/// Reads a database while others may write to it. All functions throw DatabaseError.
class History {
 public:
  /// Also throws NotOurDatabase. The file must exist.
  explicit History(const std::string& file);

  /// The last scans, the latest first.
  std::vector<EarlierScan> lastScans(std::size_t most);

  /// All results of the plug-ins whose path is `name`, or, where there is none, whose path has `name` in it: plug-in
  /// by plug-in, and the latest first within each.
  std::vector<EarlierResult> resultsOf(const std::string& name);

 private:
  std::unique_ptr<Database> database;
};

}  // namespace scanner
