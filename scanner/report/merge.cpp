// SPDX-License-Identifier: MIT
#include "scanner/report/merge.h"

#include <algorithm>
#include <map>
#include <set>
#include <tuple>
#include <utility>

#include <fmt/format.h>

#include "scanner/events/baseline.h"
#include "scanner/report/terminal.h"

namespace scanner {
namespace {

constexpr std::size_t kMostNamed = 10;  ///< Of a list in a sentence.

/// From the worst verdict to the best: what a plug-in did, then what kept it from being tried, then what is good.
constexpr Verdict kWorstFirst[] = {
    Verdict::kCrashed,     Verdict::kHung,    Verdict::kKilled,
    Verdict::kExited,      Verdict::kFailed,  Verdict::kNoInstance,
    Verdict::kNotLoadable, Verdict::kRefused, Verdict::kWrongArchitecture,
    Verdict::kNotRun,      Verdict::kPassed,  Verdict::kShell,
    Verdict::kSkipped,
};

std::ptrdiff_t rankOf(Verdict verdict) {
  return std::find(std::begin(kWorstFirst), std::end(kWorstFirst), verdict) - std::begin(kWorstFirst);
}

bool isWorse(const PluginResult& a, const PluginResult& b) {
  if (a.isWanted != b.isWanted) return b.isWanted;
  return rankOf(a.judgement.verdict) < rankOf(b.judgement.verdict);
}

/// "results.jsonl (studio, part 2 of 3)"
std::string nameOf(const RecordedScan& scan) {
  const ScanStarted& started = scan.report.started;
  const std::string part =
      started.shard.parts > 1 ? fmt::format(", part {} of {}", started.shard.part, started.shard.parts) : "";
  return fmt::format("{} ({}{})", scan.source, started.machine, part);
}

/// "a, b and 7 more"
std::string listed(const std::vector<std::string>& all) {
  const std::size_t shown = std::min(all.size(), kMostNamed);
  const std::string more =
      all.size() > shown ? fmt::format(" and {} more", all.size() - shown) : std::string();
  return fmt::format("{}{}", fmt::join(all.begin(), all.begin() + static_cast<std::ptrdiff_t>(shown), ", "),
                     more);
}

/// Adds what is new to a list, in order.
void addNew(std::vector<std::string>& all, const std::vector<std::string>& more) {
  for (const std::string& one : more) {
    if (std::find(all.begin(), all.end(), one) == all.end()) all.push_back(one);
  }
}

/// A result, and the scan that it comes from.
struct Sourced {
  PluginResult result;
  std::size_t scan = 0;
};

class Merging {
 public:
  explicit Merging(std::vector<RecordedScan> scans_) : scans(std::move(scans_)) {}

  MergedReport run() {
    formGroups();
    mergeStarts();
    nameMissingParts();
    nameCutOffScans();
    mergeResults();
    mergeEnds();
    ScanReport& report = merged.report;
    report.started.plugins = plannedPlugins();
    addNew(report.started.notes, merged.problems);
    conclude(merged);
    return std::move(merged);
  }

 private:
  void problem(const std::string& sentence) { merged.problems.push_back(sentence); }

  void lack(const std::string& sentence) {
    problem(sentence);
    merged.isWhole = false;
  }

  /// Scans of the same part of the same places try the same plug-ins. A group is named by the first of them.
  void formGroups() {
    std::map<std::tuple<unsigned, unsigned, std::vector<std::string>>, std::size_t> first;
    for (std::size_t number = 0; number < scans.size(); ++number) {
      const ScanStarted& one = scans[number].report.started;
      groups.push_back(
          first.try_emplace({one.shard.part, one.shard.parts, one.places}, number).first->second);
    }
  }

  void mergeStarts() {
    ScanStarted& all = merged.report.started;
    all = scans[0].report.started;
    std::vector<std::string> machines;
    std::vector<std::string> sandboxes;
    bool isSameShard = true;
    for (const RecordedScan& scan : scans) {
      const ScanStarted& one = scan.report.started;
      addNew(machines, {one.machine});
      addNew(all.places, one.places);
      addNew(all.notes, one.notes);
      all.time = std::min(all.time, one.time);
      all.jobs = std::max(all.jobs, one.jobs);
      isSameShard = isSameShard && one.shard.part == all.shard.part && one.shard.parts == all.shard.parts;
      nameDifference("versions", all.version, one.version, scan);
      addNew(sandboxes, {one.sandbox});
      nameDifference("limits", limitsInWords(all.limits), limitsInWords(one.limits), scan);
    }
    all.machine = fmt::format("{}", fmt::join(machines, ", "));
    all.sandbox = fmt::format("{}", fmt::join(sandboxes, "; "));
    if (!isSameShard) all.shard = {};
  }

  /// What should be the same in all scans, so that their results can be compared.
  void nameDifference(const char* what, const std::string& first, const std::string& other,
                      const RecordedScan& scan) {
    if (first == other) return;
    problem(
        fmt::format("different {}: {} in {}, {} in {}", what, first, nameOf(scans[0]), other, nameOf(scan)));
  }

  static std::string limitsInWords(const Limits& limits) {
    return fmt::format("{} s a step, {} s a run, {} bytes of memory, {} of output, {} of files",
                       limits.stepInSeconds, limits.runInSeconds, limits.memoryInBytes, limits.outputInBytes,
                       limits.filesInBytes);
  }

  void nameMissingParts() {
    std::map<unsigned, std::set<unsigned>> partsOf;  // By the number of parts.
    for (const RecordedScan& scan : scans)
      partsOf[scan.report.started.shard.parts].insert(scan.report.started.shard.part);
    for (const auto& [parts, there] : partsOf) {
      if (there.size() == parts) continue;
      std::vector<std::string> missing;
      const std::size_t count = parts - there.size();
      for (unsigned part = 1; part <= parts && missing.size() <= kMostNamed; ++part) {
        if (there.count(part) == 0) missing.push_back(std::to_string(part));
      }
      // Only as many as are named are looked for: a stream may claim four thousand million parts.
      missing.resize(std::min(missing.size(), kMostNamed));
      const std::string more =
          count > missing.size() ? fmt::format(" and {} more", count - missing.size()) : std::string();
      lack(fmt::format("missing: part{} {}{} of {}", count == 1 ? "" : "s", fmt::join(missing, ", "), more,
                       parts));
    }
  }

  void nameCutOffScans() {
    for (const RecordedScan& scan : scans) {
      const std::optional<ScanEnded>& ended = scan.report.ended;
      if (!ended) {
        std::vector<std::string> names;
        for (const Run& run : scan.underWay) names.push_back(scanner::nameOf(run, true));
        lack(nameOf(scan) + " is cut off: the scan was killed, or its results could not be written" +
             (names.empty() ? "" : "; under way: " + listed(names)));
      } else if (ended->isInterrupted) {
        lack(nameOf(scan) + " was interrupted: not every plug-in was tried");
      } else if (ended->status == 1 && ended->unwanted == 0) {
        lack(nameOf(scan) + " lacks a plug-in that was expected, or the children of a shell");
      }
    }
  }

  void mergeResults() {
    std::map<PluginKey, Sourced> byKey;
    // The same verdict twice, by the two scans.
    std::map<std::pair<std::size_t, std::size_t>, std::vector<std::string>> duplicates;
    for (std::size_t number = 0; number < scans.size(); ++number) {
      for (PluginResult& result : scans[number].report.results) {
        const auto [found, isNew] = byKey.try_emplace(keyOf(result.run));
        Sourced& kept = found->second;
        if (isNew) {
          kept = {std::move(result), number};
          continue;
        }
        if (!result.run.child) ++pluginsTwice[{groups[kept.scan], groups[number]}];
        const std::string name = scanner::nameOf(result.run, true);
        const bool isReplaced = isWorse(result, kept.result);
        if (result.judgement.verdict == kept.result.judgement.verdict) {
          duplicates[{kept.scan, number}].push_back(name);
        } else {
          const PluginResult& taken = isReplaced ? result : kept.result;
          problem(fmt::format("contradiction: {}: {} in {}, {} in {}; taken: {}", name,
                              rowOf(kept.result.judgement.verdict).word, nameOf(scans[kept.scan]),
                              rowOf(result.judgement.verdict).word, nameOf(scans[number]),
                              rowOf(taken.judgement.verdict).word));
        }
        if (isReplaced) kept = {std::move(result), number};
      }
    }
    for (const auto& [both, names] : duplicates)
      problem(fmt::format("twice, with the same verdict, in {} and in {}: {}", nameOf(scans[both.first]),
                          nameOf(scans[both.second]), listed(names)));
    for (auto& [key, sourced] : byKey) merged.report.results.push_back(std::move(sourced.result));
  }

  /// How many plug-ins, children aside, one machine would have planned to run.
  [[nodiscard]] std::size_t plannedPlugins() const {
    std::map<std::size_t, std::size_t> planned;  // By group.
    for (std::size_t number = 0; number < scans.size(); ++number) {
      std::size_t& most = planned[groups[number]];
      most = std::max(most, scans[number].report.started.plugins);
    }
    std::size_t sum = 0;
    for (const auto& [group, count] : planned) sum += count;
    for (const auto& [both, count] : pluginsTwice) {
      if (both.first != both.second) sum -= std::min(sum, count);
    }
    const auto found = std::count_if(merged.report.results.begin(), merged.report.results.end(),
                                     [](const PluginResult& result) { return !result.run.child; });
    return std::max(sum, static_cast<std::size_t>(found));
  }

  void mergeEnds() {
    ScanEnded& all = merged.report.ended.emplace();
    all.time = merged.report.started.time;
    for (const RecordedScan& scan : scans) {
      const std::optional<ScanEnded>& one = scan.report.ended;
      all.isInterrupted = all.isInterrupted || !one || one->isInterrupted;
      if (!one) continue;
      all.time = std::max(all.time, one->time);
      all.wallSeconds = std::max(all.wallSeconds, one->wallSeconds);
    }
  }

  std::vector<RecordedScan> scans;
  MergedReport merged;
  std::vector<std::size_t> groups;  ///< Of each scan.
  std::map<std::pair<std::size_t, std::size_t>, std::size_t>
      pluginsTwice;  ///< By the groups of the two scans.
};

}  // namespace

MergedReport merge(std::vector<RecordedScan> scans) { return Merging(std::move(scans)).run(); }

void sortResults(std::vector<PluginResult>& results) {
  std::vector<std::pair<PluginKey, std::size_t>> order;
  for (std::size_t i = 0; i < results.size(); ++i) order.emplace_back(keyOf(results[i].run), i);
  std::sort(order.begin(), order.end());
  std::vector<PluginResult> sorted;
  sorted.reserve(results.size());
  for (const auto& [key, i] : order) sorted.push_back(std::move(results[i]));
  results = std::move(sorted);
}

void conclude(MergedReport& merged) {
  ScanEnded& ended = *merged.report.ended;
  ended.counts.clear();
  ended.unwanted = 0;
  for (const PluginResult& result : merged.report.results) {
    ++ended.counts[rowOf(result.judgement.verdict).word];
    if (!result.isWanted) ++ended.unwanted;
  }
  ended.status = ended.unwanted > 0 || !merged.isWhole ? 1 : 0;
}

}  // namespace scanner
