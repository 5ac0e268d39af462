// SPDX-License-Identifier: MIT
// The option --baseline.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "scanner/events/baseline.h"

namespace scanner {

/// Reads the event stream that --baseline names. What is wrong with it and does no harm, such as a scan that was cut
/// off, becomes a note. Throws BrokenList with a sentence where it cannot be read or is no event stream.
Baseline readBaseline(const std::string& file, std::vector<std::string>& notes);

/// "gone since the baseline: NAME", for each.
std::vector<std::string> goneInWords(const std::vector<Run>& gone);

/// The baseline of a scan that goes on. Does nothing where none is given.
class BaselineInUse {
 public:
  /// Reads the file; an empty name for none. As readBaseline().
  BaselineInUse(const std::string& file, std::vector<std::string>& notes);

  /// Adds to the notes which plug-ins are gone. `modules` are those that were found, `started` has the places and the
  /// part.
  void begin(const std::vector<Module>& modules, ScanStarted& started);
  /// Before the result is counted.
  void apply(PluginResult& result);
  /// Sentences: the children of shells that are gone, which is known at the end only.
  [[nodiscard]] std::vector<std::string> goneChildren() const;

 private:
  std::optional<Baseline> baseline;
  std::vector<PluginKey> found;
  std::vector<std::string> places;
  Shard shard;
};

}  // namespace scanner
