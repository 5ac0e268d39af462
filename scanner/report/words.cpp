// SPDX-License-Identifier: MIT
#include "scanner/report/words.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include <fmt/format.h>

#include "scanner/events/comparison.h"

namespace scanner {
namespace {

bool isGoodWord(const std::string& word) {
  const std::optional<Verdict> verdict = verdictOf(word);
  return verdict && rowOf(*verdict).isGood;
}

/// "expected: hung (known), but crashed at 5"
std::string expectationInWords(const Expectation& expected, const Judgement& judgement) {
  const std::optional<int> step = judgement.step > 0 ? std::optional(judgement.step) : std::nullopt;
  return fmt::format("expected: {}{}, but {}", endInWords(expected.verdict, expected.step),
                     expected.reason.empty() ? "" : " (" + expected.reason + ")",
                     endInWords(rowOf(judgement.verdict).word, step));
}

/// "2 findings of memcheck: Invalid read of size 4"
std::string findingsInWords(const Diagnosis& diagnosis) {
  const auto isInPlugin = [](const Diagnosis::Finding& finding) { return finding.isInPlugin; };
  const auto& all = diagnosis.findings;
  const auto count = static_cast<std::uint64_t>(std::count_if(all.begin(), all.end(), isInPlugin));
  return fmt::format("{} of {}: {}", countInWords(count, "finding"), diagnosis.tool,
                     std::find_if(all.begin(), all.end(), isInPlugin)->text);
}

}  // namespace

std::string fileName(const std::string& path) {
  const std::size_t end = path.find_last_not_of('/');
  const std::string plain = end == std::string::npos ? path : path.substr(0, end + 1);
  return plain.substr(plain.rfind('/') + 1);
}

std::string endInWords(const std::string& verdict, const std::optional<int>& step, const char* at) {
  return step && !isGoodWord(verdict) ? fmt::format("{}{}{}", verdict, at, *step) : verdict;
}

std::string endsInWords(const Repetitions& repetitions) {
  std::string ends;
  for (const auto& [end, count] : repetitions.verdicts)
    ends += fmt::format("{}{} of {} {}", ends.empty() ? "" : ", ", count, repetitions.runs, end);
  return ends;
}

std::string changeWord(Comparison::Change change) {
  if (change == Comparison::Change::kNone) return {};
  std::string word = nameOfChange(change);
  std::replace(word.begin(), word.end(), '_', ' ');
  return word;
}

std::string changeInWords(const PluginResult& result) {
  if (!result.comparison || result.comparison->change == Comparison::Change::kNone) return {};
  const Comparison& comparison = *result.comparison;
  const std::string word = changeWord(comparison.change);
  if (!comparison.earlier)
    return comparison.change == Comparison::Change::kNew ? word + ": it was not there before" : word;
  const std::string before = fmt::format("{}: it was \"{}\" before", word,
                                         endInWords(comparison.earlier->verdict, comparison.earlier->step));
  const bool isSame = comparison.earlier->verdict == rowOf(result.judgement.verdict).word;
  switch (comparison.change) {
    case Comparison::Change::kNew:
      // It passed then as well, so that its findings are what is new.
      if (failsByFindings(result) && isSame)
        return fmt::format("{}: {} did not find all of this before", word, result.diagnosis->tool);
      return before;
    case Comparison::Change::kStillFailing:
      return comparison.earlier->step.value_or(0) == result.judgement.step ? word : before;
    case Comparison::Change::kFlaky:
      if (!isSame) return before + ", and nothing has changed since";
      return result.diagnosis
                 ? fmt::format("{}: {} does not find the same each time", word, result.diagnosis->tool)
                 : word;
    case Comparison::Change::kMended:
      return isSame && result.diagnosis
                 ? fmt::format("{}: {} finds nothing any more", word, result.diagnosis->tool)
                 : before;
    case Comparison::Change::kNone:
      break;
  }
  return {};
}

std::string whyNotWanted(const PluginResult& result) {
  const Judgement& judgement = result.judgement;
  std::vector<std::string> reasons;
  if (result.isFlaky()) reasons.push_back("flaky: " + endsInWords(*result.repetitions));
  if (result.isUnexpected()) reasons.push_back(expectationInWords(*result.expected, judgement));
  if (!judgement.cause.empty()) reasons.push_back(judgement.cause);
  if (rowOf(judgement.verdict).isGood && result.hasFindings())
    reasons.push_back(findingsInWords(*result.diagnosis));
  return fmt::format("{}", fmt::join(reasons, "; "));
}

std::string durationInWords(double seconds) {
  if (!(seconds > 0)) return "0 s";
  if (seconds < 1e-6) return fmt::format("{:.0f} ns", seconds * 1e9);
  if (seconds < 0.995e-4) return fmt::format("{:.0f} µs", seconds * 1e6);
  if (seconds < 0.00995) return fmt::format("{:.1f} ms", seconds * 1e3);
  if (seconds < 0.9995) return fmt::format("{:.0f} ms", seconds * 1e3);
  if (seconds < 9.95) return fmt::format("{:.1f} s", seconds);
  if (seconds < 59.5) return fmt::format("{:.0f} s", seconds);
  if (seconds > 1e15) return fmt::format("{:.1g} s", seconds);
  const auto whole = std::llround(seconds);
  if (whole < 3600) return fmt::format("{} min {} s", whole / 60, whole % 60);
  return fmt::format("{} h {} min", whole / 3600, whole % 3600 / 60);
}

std::string countInWords(std::uint64_t count, std::string_view thing) {
  return fmt::format("{} {}{}", count, thing, count == 1 ? "" : "s");
}

std::string incompleteness(const ScanReport& report) {
  if (!report.ended) return "the scan was killed, or its results could not be written: results are missing";
  if (report.ended->isInterrupted) return "the scan was interrupted: results are missing";
  if (report.ended->status == 1 && report.ended->unwanted == 0)
    return "the scan is not whole: a plug-in that was expected, or a part of the scan, is missing";
  return "";
}

}  // namespace scanner
