// SPDX-License-Identifier: MIT
// The result of one plug-in, and the events of a scan. Plain values; reports are made of nothing else.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "scanner/engine/run_seen.h"
#include "scanner/events/event_members.h"
#include "scanner/judge/judge.h"
#include "scanner/plan/run_list.h"

namespace scanner {

/// How often a plug-in that was run several times ended in which way. `verdicts` is keyed by the verdict's word,
/// followed by " at N" with the step where there is one.
struct Repetitions {
  unsigned runs = 1;
  std::map<std::string, unsigned> verdicts = {};

  [[nodiscard]] bool isFlaky() const { return verdicts.size() > 1; }
  /// The share of the runs that ended badly, from 0 to 1.
  [[nodiscard]] double flakeRate() const;
};

/// What the list of expectations says of the plug-in.
struct Expectation {
  std::string verdict;
  std::optional<int> step = {};
  std::string reason = {};
  bool isMet = false;
};

/// How a result compares with an earlier one of the same plug-in: the last scan's, or the baseline's.
struct Comparison {
  enum class Change {
    kNone,    ///< Good before and now, or not known before and good.
    kNew,     ///< Fails, and did not before, or in another way: with another verdict, or with more findings.
    kMended,  ///< Failed before, and is good now.
    kStillFailing,  ///< Fails with the verdict that it had before, or with no more findings.
    kFlaky,         ///< Ended differently although nothing that matters has changed, or is flaky in itself.
  };
  /// What the plug-in ended with before.
  struct Earlier {
    std::string verdict;  ///< The word.
    std::optional<int> step = {};
    double time = 0;  ///< When that run began, in seconds since 1970.
  };
  Change change = Change::kNone;
  std::optional<Earlier> earlier = {};  ///< Nothing for a plug-in that is seen for the first time.
};

/// What a tool for finding errors (memcheck, gdb or a command of the user's) said of a further run.
struct Diagnosis {
  static constexpr std::size_t kMostBytesOfReport = std::size_t{64} << 10;

  struct Finding {
    std::string kind;  ///< The tool's word: "InvalidRead", "SIGSEGV".
    std::string text;  ///< One line for people.
    /// Innermost first: "function (file:line)", "function (module+0xoffset)" or "module+0xoffset".
    std::vector<std::string> frames = {};
    /// False where neither the plug-in nor a library of its own had a part in it, as far as the tool can tell.
    bool isInPlugin = true;
  };
  std::string tool;                       ///< "memcheck", "gdb", or the command's name.
  std::vector<std::string> command = {};  ///< What repeats the run under the tool.
  std::vector<Finding> findings = {};
  std::string problem = {};  ///< Why there is no diagnosis, or what is missing in it: a sentence, or empty.
  std::string report = {};   ///< What the tool said, kMostBytesOfReport of it at most.

  /// Whether there is a finding that the plug-in has a part in.
  [[nodiscard]] bool hasFindings() const {
    return std::any_of(findings.begin(), findings.end(), [](const Finding& one) { return one.isInPlugin; });
  }
};

/// The shortest list of tests that was found to fail in the same way.
struct Shrunk {
  std::string from;           ///< The tests that were run first: "0,3,3,1". Empty where it failed before any.
  std::string tests;          ///< The list that was left of them; the same where it did not shrink.
  unsigned runs = 0;          ///< How many runs that took.
  bool isReproduced = false;  ///< Whether any of them failed in the same way.
  std::vector<std::string> command = {};  ///< What repeats the failure.
  std::string problem = {};               ///< Why this is not the shortest list: a sentence, or empty.
};

struct PluginResult {
  Run run;
  std::vector<std::string> otherNames = {};
  Judgement judgement = {};
  std::optional<RunSeen> seen = {};             ///< Nothing where no process was started.
  std::optional<Repetitions> repetitions = {};  ///< With --repeat.
  std::optional<Expectation> expected = {};     ///< With --expect, where a row matches.
  bool isWanted = true;                         ///< Good, as expected, or known from the baseline.
  std::optional<std::string> description = {};  ///< With --describe: the object that the describer printed.
  std::vector<std::string> command = {};        ///< What repeats the run.
  bool isRemembered = false;                    ///< From an earlier scan; no process was started.
  std::optional<Comparison> comparison = {};    ///< Where there is something to compare with.
  std::optional<Diagnosis> diagnosis = {};      ///< With --under.
  std::optional<Shrunk> shrunk = {};            ///< With --shrink, for a run that failed.
  /// Of a remembered result that is only written again: its event as it was. Then of the members above those
  /// are set that differ from scan to scan, and the verdict.
  std::optional<EventMembers> recorded = {};

  /// Whether its repetitions did not all end in the same way.
  [[nodiscard]] bool isFlaky() const { return repetitions && repetitions->isFlaky(); }
  /// Whether a tool has found something that the plug-in has a part in.
  [[nodiscard]] bool hasFindings() const { return diagnosis && diagnosis->hasFindings(); }
  /// Whether it was expected to end otherwise.
  [[nodiscard]] bool isUnexpected() const { return expected && !expected->isMet; }
};

struct ScanStarted {
  std::string version;
  double time = 0;  ///< Seconds since 1970.
  std::string machine;
  std::vector<std::string> places = {};
  Shard shard = {};
  unsigned jobs = 1;
  Limits limits = {};
  std::string sandbox;  ///< "bubblewrap", or "none" and why.
  std::size_t plugins = 0;
  std::vector<std::string> notes =
      {};  ///< Sentences: folders that could not be read, workers that are missing.
};

struct ScanEnded {
  double time = 0;
  double wallSeconds = 0;
  std::map<std::string, std::size_t> counts = {};  ///< By the verdict's word.
  std::size_t unwanted = 0;
  bool isInterrupted = false;
  int status = 0;  ///< Of vsttorture-scan.
};

/// A whole scan, as reports that are written at its end need it.
struct ScanReport {
  ScanStarted started;
  std::vector<PluginResult> results;
  std::optional<ScanEnded> ended;  ///< Nothing of a scan that was killed.
};

/// "new", "mended", "still_failing", "flaky"; "none" for no change worth a word.
const char* nameOfChange(Comparison::Change change);

}  // namespace scanner
