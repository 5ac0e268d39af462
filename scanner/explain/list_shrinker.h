// SPDX-License-Identifier: MIT
// Finds the shortest list of tests that still fails, in few runs.
//
// Knows nothing of processes: it says which list to run next, and is told what came of it.
//
// A run ends at the test that fails, so that test is the last one of the list. What has to go before it is looked for
// in this order: nothing; only the earlier runs of the same test; all of the list. Of a list that fails, the longest
// beginning is taken away without which it still fails, by halving; the test behind that beginning is needed, and
// the same is done with what follows it. In the end each test is left out once.
#pragma once

#include <cstddef>
#include <map>
#include <optional>
#include <vector>

namespace scanner {

class ListShrinker {
 public:
  static constexpr unsigned kMostRuns = 100;

  /// `from`: the tests of the run that failed, which ended in the last of them. At least one.
  explicit ListShrinker(std::vector<int> from, unsigned mostRuns = kMostRuns);

  /// The list to run now; nothing when there is no more to learn. No list is asked for twice.
  [[nodiscard]] const std::optional<std::vector<int>>& next() const { return wanted; }

  /// What came of the list that next() has said: whether it failed in the same way as the first run, and how
  /// many of its tests were begun then.
  void answer(bool hasFailed, std::size_t testsBegun);

  /// Whether any run has failed in the same way.
  [[nodiscard]] bool isReproduced() const { return hasReproduced; }
  /// The shortest list that has failed; the one that it began with where none has.
  [[nodiscard]] const std::vector<int>& best() const { return shortest; }
  [[nodiscard]] unsigned runs() const { return runCount; }
  /// True when the runs were used up before each test of the list was known to be needed.
  [[nodiscard]] bool isCutOff() const { return hasBeenCutOff; }

 private:
  void goOn();
  std::optional<std::vector<int>> nextUnknown();
  std::optional<std::vector<int>> nextCut();
  std::optional<std::vector<int>> nextSingle();
  /// The shortest list without `count` tests behind the first `kept`.
  [[nodiscard]] std::vector<int> without(std::size_t count) const;
  /// What is known of a list; nothing before it was run.
  [[nodiscard]] std::optional<bool> known(const std::vector<int>& list) const;

  std::vector<int> shortest;
  std::map<std::vector<int>, bool> hasListFailed;
  std::optional<std::vector<int>> wanted;
  unsigned mostRuns;
  unsigned runCount = 0;
  std::size_t kept = 0;  ///< So many tests at the beginning of the shortest list are needed.
  bool hasReproduced = false;
  bool hasBeenCutOff = false;
};

}  // namespace scanner
