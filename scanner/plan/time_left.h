// SPDX-License-Identifier: MIT
// How long the rest of a scan will take.
#pragma once

#include <cstddef>

namespace scanner {

/// Estimates from what each run took in an earlier scan, as far as that is known, and from what the runs of this
/// scan have taken so far. All times are in seconds.
class TimeLeft {
 public:
  /// A run is still to come, or under way. `earlier` is how long it took before, 0 where that is not known.
  void expect(double earlier);

  /// It is over. `earlier` as given to expect().
  void ended(double earlier, double took);

  /// Until all are over, with `jobs` at a time; 0 where nothing is known yet.
  [[nodiscard]] double seconds(unsigned jobs) const;

 private:
  double knownToCome = 0;
  std::size_t unknownToCome = 0;
  double earlierOfEnded = 0;  ///< Of those with a known duration,
  double tookOfKnown = 0;     ///< and what they took now.
  double tookOfAll = 0;
  std::size_t endedInAll = 0;
  std::size_t knownInAll = 0;  ///< To come or ended, and their sum:
  double sumOfKnown = 0;
};

}  // namespace scanner
