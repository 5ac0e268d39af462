// SPDX-License-Identifier: MIT
// The result of one plug-in, and the events of a scan. Plain values; reports are made of nothing else.
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "scanner/engine/run_seen.h"
#include "scanner/judge/judge.h"
#include "scanner/plan/run_list.h"

namespace scanner {

/// How often a plug-in that was run several times ended in which way. `verdicts` is keyed by the verdict's word,
/// followed by " at N" with the step where there is one.
struct Repetitions {
  unsigned runs = 1;
  std::map<std::string, unsigned> verdicts = {};

  [[nodiscard]] bool isFlaky() const { return verdicts.size() > 1; }
};

/// What the list of expectations says of the plug-in.
struct Expectation {
  std::string verdict;
  std::optional<int> step = {};
  std::string reason = {};
  bool isMet = false;
};

struct PluginResult {
  Run run;
  std::vector<std::string> otherNames = {};
  Judgement judgement = {};
  std::optional<RunSeen> seen = {};             ///< Nothing where no process was started.
  std::optional<Repetitions> repetitions = {};  ///< With --repeat.
  std::optional<Expectation> expected = {};     ///< With --expect, where a row matches.
  bool isWanted = true;                         ///< Good, or as expected.
  std::optional<std::string> description = {};  ///< With --describe: the object that the describer printed.
  std::vector<std::string> command = {};        ///< What repeats the run.
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

}  // namespace scanner
