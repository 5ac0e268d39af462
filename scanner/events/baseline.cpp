// SPDX-License-Identifier: MIT
#include "scanner/events/baseline.h"

#include <algorithm>
#include <set>
#include <utility>

#include "scanner/events/comparison.h"
#include "scanner/events/event_json.h"

namespace scanner {
namespace {

bool isFlaky(const PluginResult& result) { return result.repetitions && result.repetitions->isFlaky(); }

bool isUnmet(const PluginResult& result) { return result.expected && !result.expected->isMet; }

/// How many findings of the plug-in there are of each kind.
std::map<std::string, std::size_t> findingsByKind(const PluginResult& result) {
  std::map<std::string, std::size_t> counts;
  if (!result.diagnosis) return counts;
  for (const Diagnosis::Finding& finding : result.diagnosis->findings) {
    if (finding.isInPlugin) ++counts[result.diagnosis->tool + " " + finding.kind];
  }
  return counts;
}

/// Whether there are no more findings of any kind than before. Their frames say less: they change with every build.
bool areFindingsKnown(const PluginResult& now, const PluginResult& earlier) {
  const std::map<std::string, std::size_t> before = findingsByKind(earlier);
  for (const auto& [kind, count] : findingsByKind(now)) {
    const auto found = before.find(kind);
    if (found == before.end() || found->second < count) return false;
  }
  return true;
}

bool isKnown(const PluginResult& now, const PluginResult& earlier) {
  if (isFlaky(now)) return isFlaky(earlier);
  if (now.judgement.verdict != earlier.judgement.verdict) return false;
  if (!rowOf(now.judgement.verdict).isGood)
    return now.comparison->change == Comparison::Change::kStillFailing;
  return (!isUnmet(now) || isUnmet(earlier)) && areFindingsKnown(now, earlier);
}

bool isBelow(const std::string& path, const std::string& folder) {
  if (folder.empty() || path.compare(0, folder.size(), folder) != 0) return false;
  return folder.back() == '/' || (path.size() > folder.size() && path[folder.size()] == '/');
}

}  // namespace

PluginKey keyOf(const Run& run) { return {validUtf8(run.bundle), run.child, run.target.processor}; }

Baseline::Baseline(const std::vector<PluginResult>& all) {
  for (const PluginResult& one : all) {
    PluginResult kept;
    kept.run = one.run;
    kept.judgement.verdict = one.judgement.verdict;
    kept.judgement.step = one.judgement.step;
    if (one.seen) kept.seen.emplace().startedAt = one.seen->startedAt;
    kept.repetitions = one.repetitions;
    kept.expected = one.expected;
    kept.diagnosis = one.diagnosis;
    if (kept.diagnosis) kept.diagnosis->report.clear();
    results[keyOf(one.run)] = std::move(kept);
  }
}

void Baseline::apply(PluginResult& result) const {
  const auto found = results.find(keyOf(result.run));
  const PluginResult* earlier = found == results.end() ? nullptr : &found->second;
  result.comparison = compare(result, earlier, false);
  if (earlier != nullptr && isKnown(result, *earlier)) result.isWanted = true;
}

std::vector<Run> Baseline::gone(const std::vector<PluginKey>& now, const std::vector<std::string>& places,
                                const Shard& shard) const {
  const std::set<PluginKey> here(now.begin(), now.end());
  std::vector<Run> missing;
  for (const auto& [key, result] : results) {
    const Run& run = result.run;
    if (here.count(key) > 0 || result.judgement.verdict == Verdict::kSkipped) continue;
    if (!isInShard(shard, run.bundle)) continue;
    const bool isSearched = std::any_of(places.begin(), places.end(), [&run](const std::string& place) {
      return isBelow(run.bundle, validUtf8(place));
    });
    const PluginKey shell = {std::get<0>(key), std::nullopt, std::get<2>(key)};
    if (run.child ? here.count(shell) > 0 : isSearched) missing.push_back(run);
  }
  return missing;
}

}  // namespace scanner
