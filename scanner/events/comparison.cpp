// SPDX-License-Identifier: MIT
#include "scanner/events/comparison.h"

namespace scanner {
namespace {

bool isGood(const PluginResult& result) { return rowOf(result.judgement.verdict).isGood; }

/// Whether the plug-in itself gave rise to the verdict, rather than a list, a missing worker or our own trouble.
bool isOfARun(Verdict verdict) {
  return verdict != Verdict::kSkipped && verdict != Verdict::kNotRun &&
         verdict != Verdict::kWrongArchitecture;
}

bool saysNothing(Verdict verdict) { return verdict == Verdict::kSkipped || verdict == Verdict::kNotRun; }

Comparison::Change changeBetween(const PluginResult& now, const PluginResult* earlier, bool isUnchanged) {
  const Verdict verdict = now.judgement.verdict;
  if (verdict == Verdict::kSkipped) return Comparison::Change::kNone;
  if (now.repetitions && now.repetitions->isFlaky()) return Comparison::Change::kFlaky;
  const bool fails = !isGood(now) && !now.isWanted;
  if (earlier == nullptr) return fails ? Comparison::Change::kNew : Comparison::Change::kNone;

  const Verdict before = earlier->judgement.verdict;
  const bool isSame = verdict == before;
  if (isUnchanged && !isSame && isOfARun(verdict) && isOfARun(before)) return Comparison::Change::kFlaky;
  if (fails) return isSame ? Comparison::Change::kStillFailing : Comparison::Change::kNew;
  return isGood(now) && !isGood(*earlier) ? Comparison::Change::kMended : Comparison::Change::kNone;
}

}  // namespace

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
