// SPDX-License-Identifier: MIT
// Compares results with those of an earlier scan, so that only what is new counts as a failure.
#pragma once

#include <cstddef>
#include <map>
#include <optional>
#include <string>
#include <tuple>
#include <vector>

#include "scanner/events/result.h"

namespace scanner {

/// The same plug-in in two scans: bundle, child (none first) and processor. Machines of two architectures have
/// different plug-ins under the same path.
using PluginKey = std::tuple<std::string, std::optional<std::int32_t>, std::string>;
PluginKey keyOf(const Run& run);

class Baseline {
 public:
  /// Of several results of a plug-in the last one counts.
  explicit Baseline(const std::vector<PluginResult>& results);

  /// Fills PluginResult::comparison. A result that is not wanted becomes wanted where it is known from the baseline:
  /// a failure with the same verdict, a flaky plug-in that was flaky, an expectation that was not met in the same way,
  /// no more findings of a tool than there were.
  void apply(PluginResult& result) const;

  /// The plug-ins of the baseline that are not in `now` although a scan of these places and this part would have
  /// found them, in order. Skipped ones, and children of a shell that is itself missing, are left out.
  [[nodiscard]] std::vector<Run> gone(const std::vector<PluginKey>& now,
                                      const std::vector<std::string>& places, const Shard& shard) const;

 private:
  /// By key, with what a comparison needs of them.
  std::map<PluginKey, PluginResult> results;
};

}  // namespace scanner
