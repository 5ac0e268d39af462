// SPDX-License-Identifier: MIT
#include "scanner/events/comparison.h"

#include <algorithm>
#include <map>
#include <string>

namespace scanner {
namespace {

using Change = Comparison::Change;

bool isGood(const PluginResult& result) { return rowOf(result.judgement.verdict).isGood; }

/// Whether the plug-in itself gave rise to the verdict, rather than a list, a missing worker or our own trouble.
bool isOfARun(Verdict verdict) {
  return verdict != Verdict::kSkipped && verdict != Verdict::kNotRun &&
         verdict != Verdict::kWrongArchitecture;
}

bool saysNothing(Verdict verdict) { return verdict == Verdict::kSkipped || verdict == Verdict::kNotRun; }

/// How many findings of the plug-in there are of each kind.
std::map<std::string, std::size_t> findingsByKind(const PluginResult& result) {
  std::map<std::string, std::size_t> counts;
  for (const Diagnosis::Finding& finding : result.diagnosis->findings) {
    if (finding.isInPlugin) ++counts[finding.kind];
  }
  return counts;
}

bool isUnderTheSameTool(const PluginResult& now, const PluginResult& earlier) {
  return now.diagnosis && earlier.diagnosis && now.diagnosis->tool == earlier.diagnosis->tool;
}

/// Whether there are no more findings of any kind than before. Their texts and frames say less: they change
/// with every build.
bool areFindingsKnown(const PluginResult& now, const PluginResult& earlier) {
  if (!isUnderTheSameTool(now, earlier)) return false;
  const std::map<std::string, std::size_t> before = findingsByKind(earlier);
  const std::map<std::string, std::size_t> found = findingsByKind(now);
  return std::all_of(found.begin(), found.end(), [&before](const auto& kindAndCount) {
    const auto then = before.find(kindAndCount.first);
    return then != before.end() && then->second >= kindAndCount.second;
  });
}

/// Of a plug-in whose verdict is good, and was.
Change changeOfFindings(const PluginResult& now, const PluginResult& earlier, bool isUnchanged) {
  if (failsByFindings(now)) {
    if (areFindingsKnown(now, earlier)) return Change::kStillFailing;
    return isUnchanged && isUnderTheSameTool(now, earlier) ? Change::kFlaky : Change::kNew;
  }
  const bool hasLooked = isUnderTheSameTool(now, earlier) && now.diagnosis->problem.empty();
  if (!hasLooked || now.hasFindings() || !earlier.hasFindings()) return Change::kNone;
  return isUnchanged ? Change::kFlaky : Change::kMended;
}

Change changeBetween(const PluginResult& now, const PluginResult* earlier, bool isUnchanged) {
  const Verdict verdict = now.judgement.verdict;
  if (saysNothing(verdict)) return Change::kNone;
  if (now.isFlaky()) return Change::kFlaky;
  const bool fails = failsByFindings(now) || (!isGood(now) && !now.isWanted);
  if (earlier == nullptr) return fails ? Change::kNew : Change::kNone;

  const Verdict before = earlier->judgement.verdict;
  const bool isSame = verdict == before;
  if (isUnchanged && !isSame && isOfARun(verdict) && isOfARun(before)) return Change::kFlaky;
  if (isGood(now) && isGood(*earlier)) return changeOfFindings(now, *earlier, isUnchanged);
  if (fails) return isSame ? Change::kStillFailing : Change::kNew;
  return isGood(now) ? Change::kMended : Change::kNone;
}

}  // namespace

bool failsByFindings(const PluginResult& result) {
  return isGood(result) && result.hasFindings() && !result.isWanted && !result.expected;
}

Comparison compare(const PluginResult& now, const PluginResult* earlier, bool isUnchanged) {
  if (earlier != nullptr && saysNothing(earlier->judgement.verdict)) earlier = nullptr;
  Comparison comparison;
  comparison.change = changeBetween(now, earlier, isUnchanged);
  if (earlier != nullptr) {
    Comparison::Earlier then;
    then.verdict = rowOf(earlier->judgement.verdict).word;
    if (earlier->judgement.step > 0) then.step = earlier->judgement.step;
    then.time = earlier->seen ? earlier->seen->startedAt : 0;
    comparison.earlier = then;
  }
  return comparison;
}

}  // namespace scanner
