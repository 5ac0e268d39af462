// SPDX-License-Identifier: MIT
#include "scanner/events/baseline.h"

#include <algorithm>

#include "scanner/events/comparison.h"
#include "scanner/events/event_json.h"

namespace scanner {
namespace {

bool isKnown(const PluginResult& now, const PluginResult& earlier) {
  if (now.isFlaky()) return earlier.isFlaky();
  if (now.judgement.verdict != earlier.judgement.verdict) return false;
  if (!rowOf(now.judgement.verdict).isGood || failsByFindings(now))
    return now.comparison->change == Comparison::Change::kStillFailing;
  return !now.isUnexpected() || earlier.isUnexpected();
}

bool isBelow(const std::string& path, const std::string& folder) {
  if (folder.empty() || path.compare(0, folder.size(), folder) != 0) return false;
  return folder.back() == '/' || (path.size() > folder.size() && path[folder.size()] == '/');
}

/// Ends of the paths of several bundles: "x.so", "build/x.so", and so on.
class PathEnds {
 public:
  void add(const std::pair<std::string, std::string>& bundle) {
    const std::string& path = bundle.first;
    for (std::size_t slash = path.rfind('/'); slash != std::string::npos;
         slash = slash == 0 ? std::string::npos : path.rfind('/', slash - 1)) {
      const auto [end, isNew] = ends.try_emplace({path.substr(slash + 1), bundle.second}, &path);
      if (!isNew) end->second = nullptr;
    }
  }

  /// Whether any path ends so. Sets `path` to the only one that does, or to null.
  bool find(const std::string& end, const std::string& processor, const std::string*& path) const {
    const auto found = ends.find({end, processor});
    path = found == ends.end() ? nullptr : found->second;
    return found != ends.end();
  }

 private:
  /// By end and processor; null for more than one path.
  std::map<std::pair<std::string, std::string>, const std::string*> ends;
};

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

void Baseline::locate(const std::vector<Run>& runs) {
  std::set<Bundle> then;
  for (const auto& [key, result] : results) then.emplace(std::get<0>(key), std::get<2>(key));
  std::set<Bundle> now;
  for (const Run& run : runs) now.emplace(validUtf8(run.bundle), run.target.processor);
  PathEnds endsThen;
  for (const Bundle& bundle : then) {
    if (now.count(bundle) == 0) endsThen.add(bundle);
  }
  PathEnds endsNow;
  for (const Bundle& bundle : now) {
    if (then.count(bundle) == 0) endsNow.add(bundle);
  }
  for (const Bundle& bundle : now) {
    const auto& [path, processor] = bundle;
    if (then.count(bundle) > 0) continue;
    // The longest end first.
    for (std::size_t slash = path.find('/'); slash != std::string::npos; slash = path.find('/', slash + 1)) {
      const std::string end = path.substr(slash + 1);
      const std::string* pathThen = nullptr;
      const std::string* pathNow = nullptr;
      if (!endsThen.find(end, processor, pathThen)) continue;
      endsNow.find(end, processor, pathNow);
      if (pathThen != nullptr && pathNow != nullptr) {
        pathsThen[bundle] = *pathThen;
        moves.emplace(pathThen->substr(0, pathThen->size() - end.size()), path.substr(0, slash + 1));
      }
      break;
    }
  }
}

PluginKey Baseline::keyThen(const PluginKey& now) const {
  const auto& [bundle, child, processor] = now;
  const auto moved = pathsThen.find({bundle, processor});
  return moved == pathsThen.end() ? now : PluginKey{moved->second, child, processor};
}

void Baseline::apply(PluginResult& result) const {
  const auto found = results.find(keyThen(keyOf(result.run)));
  const PluginResult* earlier = found == results.end() ? nullptr : &found->second;
  result.comparison = compare(result, earlier, false);
  if (earlier != nullptr && isKnown(result, *earlier)) result.isWanted = true;
}

bool Baseline::wouldBeFound(const std::string& bundle, const std::vector<std::string>& places,
                            const Shard& shard) const {
  const auto isSearched = [&](const std::string& path) {
    return isInShard(shard, path) && std::any_of(places.begin(), places.end(), [&](const std::string& place) {
             return isBelow(path, validUtf8(place));
           });
  };
  return isSearched(bundle) || std::any_of(moves.begin(), moves.end(), [&](const auto& move) {
           return isBelow(bundle, move.first) && isSearched(move.second + bundle.substr(move.first.size()));
         });
}

std::vector<Run> Baseline::gone(const std::vector<PluginKey>& now, const std::vector<std::string>& places,
                                const Shard& shard) const {
  std::map<PluginKey, std::string> here;  // With today's paths.
  for (const PluginKey& key : now) here[keyThen(key)] = std::get<0>(key);
  std::vector<Run> missing;
  for (const auto& [key, result] : results) {
    const Run& run = result.run;
    if (here.count(key) > 0 || result.judgement.verdict == Verdict::kSkipped) continue;
    const auto shell = here.find({std::get<0>(key), std::nullopt, std::get<2>(key)});
    const bool isMissing = run.child ? shell != here.end() && isInShard(shard, shell->second)
                                     : wouldBeFound(run.bundle, places, shard);
    if (isMissing) missing.push_back(run);
  }
  return missing;
}

}  // namespace scanner
