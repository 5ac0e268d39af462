// SPDX-License-Identifier: MIT
// The verdicts: one word per cause.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "scanner/engine/run_seen.h"

namespace scanner {

enum class Verdict {
  kPassed,
  kShell,
  kFailed,
  kCrashed,
  kExited,
  kHung,
  kKilled,
  kNoInstance,
  kNotLoadable,
  kWrongArchitecture,
  kRefused,
  kSkipped,
  kNotRun,
};

/// One row of the table that docs/VERDICTS.md shows.
struct VerdictRow {
  Verdict verdict;
  const char* word;     ///< "passed", "shell", "failed" and so on, the same in every report.
  const char* meaning;  ///< A sentence.
  const char* advice;   ///< What to do; a sentence.
  bool isGood;          ///< Nothing to worry about: passed, shell, skipped.
};

const std::vector<VerdictRow>& verdictTable();
const VerdictRow& rowOf(Verdict verdict);
std::vector<std::string> verdictWords();

}  // namespace scanner
