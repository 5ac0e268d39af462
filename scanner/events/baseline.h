// SPDX-License-Identifier: MIT
// Compares results with those of an earlier scan, so that only what is new counts as a failure.
#pragma once

#include <cstddef>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "scanner/events/result.h"

namespace scanner {

/// The same plug-in in two scans: bundle, child (none first) and processor. Machines of two architectures have
/// different plug-ins under the same path.
using PluginKey = std::tuple<std::string, std::optional<std::int32_t>, std::string>;
PluginKey keyOf(const Run& run);

/// Plug-ins are the same in both scans where their paths are. The folder around them may have moved, as it
/// does between the jobs of a CI system: see locate().
class Baseline {
 public:
  /// Of several results of a plug-in the last one counts.
  explicit Baseline(const std::vector<PluginResult>& results);

  /// Finds those plug-ins of a scan that had another path then. `runs` are all that the scan has found; their
  /// children do not matter, since they go with their shell. Call it before the other functions.
  ///
  /// A plug-in whose path the baseline does not have is compared with one of the same file name there whose
  /// path this scan does not have. Of several it is the one whose path has the most last parts in common with
  /// it; where two have as many, on either side, it is compared with none.
  void locate(const std::vector<Run>& runs);

  /// Fills PluginResult::comparison. A result that is not wanted becomes wanted where it is known from the baseline:
  /// a failure with the same verdict, a flaky plug-in that was flaky, an expectation that was not met in the same way,
  /// no more findings of a tool than there were.
  void apply(PluginResult& result) const;

  /// The plug-ins of the baseline that are not in `now` although a scan of these places and this part would
  /// have found them, in order, with the paths that they had. Skipped ones, and children of a shell that is
  /// itself missing, are left out.
  [[nodiscard]] std::vector<Run> gone(const std::vector<PluginKey>& now,
                                      const std::vector<std::string>& places, const Shard& shard) const;

 private:
  using Bundle = std::pair<std::string, std::string>;  ///< Its path and its processor.

  [[nodiscard]] PluginKey keyThen(const PluginKey& now) const;
  [[nodiscard]] bool wouldBeFound(const std::string& bundle, const std::vector<std::string>& places,
                                  const Shard& shard) const;

  /// By key, with what a comparison needs of them.
  std::map<PluginKey, PluginResult> results;
  std::map<Bundle, std::string> pathsThen;  ///< Of the bundles of this scan that had another path.
  std::set<std::pair<std::string, std::string>> moves;  ///< Beginnings of paths: then, and now.
};

}  // namespace scanner
