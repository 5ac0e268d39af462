// SPDX-License-Identifier: MIT
#include "scanner/explain/list_shrinker.h"

#include <algorithm>
#include <iterator>
#include <utility>

namespace scanner {
namespace {

using Difference = std::vector<int>::difference_type;

/// Only those tests that are the same as the last one.
std::vector<int> onlyTheLastKind(const std::vector<int>& list) {
  std::vector<int> kind;
  std::copy_if(list.begin(), list.end(), std::back_inserter(kind),
               [&](int test) { return test == list.back(); });
  return kind;
}

}  // namespace

ListShrinker::ListShrinker(std::vector<int> from, unsigned mostRuns_)
    : shortest(std::move(from)), mostRuns(mostRuns_) {
  goOn();
}

void ListShrinker::answer(bool hasFailed, std::size_t testsBegun) {
  ++runCount;
  std::vector<int> list = *wanted;
  hasListFailed[list] = hasFailed;
  if (hasFailed) {
    hasReproduced = true;
    // It has ended before its last test: what follows is not needed.
    if (testsBegun > 0 && testsBegun < list.size()) list.resize(testsBegun);
    hasListFailed[list] = true;
    shortest = std::move(list);
    kept = std::min(kept, shortest.size() - 1);
  }
  goOn();
}

void ListShrinker::goOn() {
  wanted = nextUnknown();
  hasBeenCutOff = wanted.has_value() && runCount >= mostRuns;
  if (hasBeenCutOff) wanted.reset();
}

std::optional<std::vector<int>> ListShrinker::nextUnknown() {
  if (!hasReproduced) {
    for (const std::vector<int>& list :
         {std::vector<int>{shortest.back()}, onlyTheLastKind(shortest), shortest}) {
      if (!known(list)) return list;
    }
    return std::nullopt;
  }
  std::optional<std::vector<int>> list = nextCut();
  return list ? list : nextSingle();
}

std::optional<std::vector<int>> ListShrinker::nextCut() {
  while (kept + 1 < shortest.size()) {
    const std::size_t all = shortest.size() - 1 - kept;
    const std::optional<bool> hasAllFailed = known(without(all));
    if (!hasAllFailed) return without(all);
    if (*hasAllFailed) {
      shortest = without(all);
      return std::nullopt;
    }
    // The fewest that were left out of a list that passed. With none left out it fails.
    std::size_t passes = 1;
    while (known(without(passes)) != false) ++passes;
    if (passes > 1) return without(passes / 2);
    ++kept;
  }
  return std::nullopt;
}

std::optional<std::vector<int>> ListShrinker::nextSingle() {
  for (std::size_t at = 0; at + 1 < shortest.size(); ++at) {
    std::vector<int> list = shortest;
    list.erase(list.begin() + static_cast<Difference>(at));
    const std::optional<bool> failure = known(list);
    if (!failure) return list;
    if (*failure) {
      shortest = std::move(list);
      kept = shortest.size() - 1;
      at = static_cast<std::size_t>(-1);  // From the beginning.
    }
  }
  return std::nullopt;
}

std::vector<int> ListShrinker::without(std::size_t count) const {
  std::vector<int> list = shortest;
  const auto begin = list.begin() + static_cast<Difference>(kept);
  list.erase(begin, begin + static_cast<Difference>(count));
  return list;
}

std::optional<bool> ListShrinker::known(const std::vector<int>& list) const {
  const auto found = hasListFailed.find(list);
  return found == hasListFailed.end() ? std::nullopt : std::optional<bool>(found->second);
}

}  // namespace scanner
