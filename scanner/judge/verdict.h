// SPDX-License-Identifier: MIT
// The verdicts: one word per cause.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

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
/// Nothing for a word that is no verdict's.
std::optional<Verdict> verdictOf(std::string_view word);

}  // namespace scanner
