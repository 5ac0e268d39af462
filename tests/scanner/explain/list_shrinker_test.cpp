// SPDX-License-Identifier: MIT
#include <cmath>
#include <functional>
#include <random>
#include <set>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "scanner/explain/list_shrinker.h"

namespace scanner {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

using List = std::vector<int>;

/// A plug-in: whether it fails in the last of these tests, when it did not in an earlier one.
using Plugin = std::function<bool(const List&)>;

/// How many tests of a list a plug-in begins when it fails in one of them; 0 for a pass.
std::size_t failsAt(const Plugin& plugin, const List& list) {
  for (std::size_t begun = 1; begun <= list.size(); ++begun) {
    if (plugin(List(list.begin(), list.begin() + static_cast<std::ptrdiff_t>(begun)))) return begun;
  }
  return 0;
}

struct Shrinking {
  List best;
  std::vector<List> run;
  bool isReproduced = false;
  bool isCutOff = false;
};

Shrinking shrink(const List& from, const Plugin& plugin, unsigned mostRuns = ListShrinker::kMostRuns) {
  ListShrinker shrinker(from, mostRuns);
  Shrinking shrinking;
  while (shrinker.next()) {
    const List list = *shrinker.next();
    shrinking.run.push_back(list);
    const std::size_t begun = failsAt(plugin, list);
    shrinker.answer(begun > 0, begun > 0 ? begun : list.size());
  }
  shrinking.best = shrinker.best();
  shrinking.isReproduced = shrinker.isReproduced();
  shrinking.isCutOff = shrinker.isCutOff();
  EXPECT_EQ(shrinker.runs(), shrinking.run.size());
  return shrinking;
}

/// Fails in the last test of `needed` when the others have been run before, in this order.
Plugin needsInOrder(const List& needed) {
  return [needed](const List& tests) {
    if (tests.back() != needed.back()) return false;
    std::size_t found = 0;
    for (const int test : tests) {
      if (found < needed.size() && test == needed[found]) ++found;
    }
    return found == needed.size();
  };
}

/// All of a list's tests but one; each way to do that.
std::vector<List> withoutOne(const List& list) {
  std::vector<List> lists;
  for (std::size_t left = 0; left < list.size(); ++left) {
    List shorter = list;
    shorter.erase(shorter.begin() + static_cast<std::ptrdiff_t>(left));
    lists.push_back(shorter);
  }
  return lists;
}

void expectShortest(const Plugin& plugin, const Shrinking& shrinking) {
  EXPECT_EQ(failsAt(plugin, shrinking.best), shrinking.best.size());
  for (const List& shorter : withoutOne(shrinking.best)) EXPECT_EQ(failsAt(plugin, shorter), 0U);
  EXPECT_EQ(std::set<List>(shrinking.run.begin(), shrinking.run.end()).size(), shrinking.run.size());
}

List randomList(std::mt19937& random, std::size_t size, int kinds) {
  List list;
  while (list.size() < size) list.push_back(static_cast<int>(random() % static_cast<unsigned>(kinds)));
  return list;
}

TEST(ListShrinker, ATestThatFailsByItselfTakesOneRun) {
  const Shrinking shrinking = shrink({0, 1, 2, 3}, needsInOrder({3}));
  EXPECT_THAT(shrinking.run, ElementsAre(List{3}));
  EXPECT_THAT(shrinking.best, ElementsAre(3));
  EXPECT_TRUE(shrinking.isReproduced);
}

TEST(ListShrinker, ATestThatFailsTheSecondTimeTakesTwoRuns) {
  const Shrinking shrinking = shrink({0, 3, 1, 3, 2, 3}, needsInOrder({3, 3}));
  EXPECT_THAT(shrinking.run, ElementsAre(List{3}, List{3, 3, 3}));
  EXPECT_THAT(shrinking.best, ElementsAre(3, 3));
}

TEST(ListShrinker, AFailureThatDoesNotComeAgainKeepsTheListAsItWas) {
  const Shrinking shrinking = shrink({0, 3, 1, 3}, [](const List&) { return false; });
  EXPECT_THAT(shrinking.run, ElementsAre(List{3}, List{3, 3}, List{0, 3, 1, 3}));
  EXPECT_THAT(shrinking.best, ElementsAre(0, 3, 1, 3));
  EXPECT_FALSE(shrinking.isReproduced);
}

TEST(ListShrinker, AListThatFailsEarlierEndsThere) {
  // Fails at once in test 1, which the first run had passed.
  const Shrinking shrinking = shrink({1, 0, 2}, [](const List& tests) { return tests.back() == 1; });
  EXPECT_THAT(shrinking.best, ElementsAre(1));
  EXPECT_TRUE(shrinking.isReproduced);
}

TEST(ListShrinker, WhenTheRunsAreUsedUpTheShortestListSoFarStays) {
  const Plugin plugin = needsInOrder({1, 2, 3, 4});
  const Shrinking shrinking = shrink({0, 1, 0, 2, 0, 3, 0, 4}, plugin, 4);
  EXPECT_EQ(shrinking.run.size(), 4U);
  EXPECT_TRUE(shrinking.isCutOff);
  EXPECT_GT(failsAt(plugin, shrinking.best), 0U);
  EXPECT_FALSE(shrink({0, 1, 0, 2, 0, 3, 0, 4}, plugin).isCutOff);
}

TEST(ListShrinker, EveryListOfUpToSevenTestsEndsInAShortestOne) {
  for (std::size_t size = 1; size <= 7; ++size) {
    const std::size_t kinds = size <= 5 ? 3 : 2;  // More would take too long.
    std::size_t lists = 1;
    for (std::size_t i = 0; i < size; ++i) lists *= kinds;
    for (std::size_t number = 0; number < lists; ++number) {
      List from;
      for (std::size_t rest = number; from.size() < size; rest /= kinds)
        from.push_back(static_cast<int>(rest % kinds));
      // Every set of tests of this list that may be needed before the last one.
      for (unsigned needed = 0; needed < 1U << (size - 1); ++needed) {
        List tests;
        for (std::size_t at = 0; at + 1 < size; ++at) {
          if ((needed >> at & 1U) != 0) tests.push_back(from[at]);
        }
        tests.push_back(from.back());
        const Plugin plugin = needsInOrder(tests);
        const Shrinking shrinking = shrink(from, plugin);
        ASSERT_NO_FATAL_FAILURE(expectShortest(plugin, shrinking));
        ASSERT_TRUE(shrinking.isReproduced);
        ASSERT_EQ(shrinking.best.size(), tests.size());
      }
    }
  }
}

TEST(ListShrinker, APluginThatFailsWithoutAnySenseEndsInAListThatFailsAndNoneOfItsPartsDoes) {
  std::mt19937 random(7);
  for (int round = 0; round < 20000; ++round) {
    std::map<List, bool> answers;
    const Plugin plugin = [&](const List& tests) {
      const auto answer = answers.find(tests);
      if (answer != answers.end()) return answer->second;
      return answers[tests] = random() % 8 == 0;
    };
    List from = randomList(random, 1 + random() % 7, 3);
    const std::size_t begun = failsAt(plugin, from);
    if (begun == 0) continue;
    from.resize(begun);
    const Shrinking shrinking = shrink(from, plugin);
    ASSERT_TRUE(shrinking.isReproduced);
    ASSERT_NO_FATAL_FAILURE(expectShortest(plugin, shrinking));
  }
}

TEST(ListShrinker, AWholeRunTakesAFewRunsForEachTestThatIsNeeded) {
  std::mt19937 random(62);
  for (int round = 0; round < 2000; ++round) {
    const List from = randomList(random, 62, 5);
    List needed = randomList(random, random() % 4, 5);
    needed.push_back(from.back());
    const Plugin plugin = needsInOrder(needed);
    if (failsAt(plugin, from) != from.size()) continue;
    const Shrinking shrinking = shrink(from, plugin);
    ASSERT_NO_FATAL_FAILURE(expectShortest(plugin, shrinking));
    // Three to begin with; for each needed test six halvings, one look whether it is the last such test, and one
    // run without it.
    ASSERT_LE(shrinking.run.size(), 3 + 8 * (needed.size() - 1));
  }
}

}  // namespace
}  // namespace scanner
