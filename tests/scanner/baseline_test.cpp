// SPDX-License-Identifier: MIT
#include <gmock/gmock.h>

#include "scanner/events/baseline.h"
#include "scanner/report/terminal.h"
#include "tests/scanner/report_fixture.h"

using namespace scanner;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

namespace {

using Change = Comparison::Change;

PluginResult flaky(PluginResult result) {
  result.repetitions = Repetitions{2, {{"passed", 1}, {"crashed at 5", 1}}};
  result.isWanted = false;
  return result;
}

PluginResult unmet(PluginResult result) {
  result.expected = Expectation{"hung", {}, "known", false};
  result.isWanted = false;
  return result;
}

/// Passed, but memcheck has found something.
PluginResult found(const std::vector<std::string>& kinds) {
  PluginResult result = resultOf("/lib/a.so", Verdict::kPassed);
  result.diagnosis.emplace();
  result.diagnosis->tool = "memcheck";
  for (const std::string& kind : kinds) result.diagnosis->findings.push_back({kind, "text", {}});
  result.isWanted = kinds.empty();
  return result;
}

const PluginResult kPassed = resultOf("/lib/a.so", Verdict::kPassed);
const PluginResult kCrashedAt5 = resultOf("/lib/a.so", Verdict::kCrashed, 5);
const PluginResult kCrashedAt9 = resultOf("/lib/a.so", Verdict::kCrashed, 9);
const PluginResult kHung = resultOf("/lib/a.so", Verdict::kHung);

struct Case {
  const char* name;
  PluginResult before;
  PluginResult now;
  Change change;
  bool isWanted;
};

class BaselineApply : public ::testing::TestWithParam<Case> {};

TEST_P(BaselineApply, OnlyWhatIsNewIsNotWanted) {
  PluginResult result = GetParam().now;
  Baseline({GetParam().before}).apply(result);
  EXPECT_EQ(nameOfChange(result.comparison->change), std::string(nameOfChange(GetParam().change)));
  EXPECT_EQ(result.isWanted, GetParam().isWanted);
}

INSTANTIATE_TEST_SUITE_P(
    , BaselineApply,
    ::testing::Values(Case{"StillPasses", kPassed, kPassed, Change::kNone, true},
                      Case{"FailsNow", kPassed, kCrashedAt5, Change::kNew, false},
                      Case{"FailsInTheSameWay", kCrashedAt5, kCrashedAt5, Change::kStillFailing, true},
                      Case{"FailsAtAnotherStep", kCrashedAt5, kCrashedAt9, Change::kStillFailing, true},
                      Case{"FailsInAnotherWay", kCrashedAt5, kHung, Change::kNew, false},
                      Case{"IsMended", kCrashedAt5, kPassed, Change::kMended, true},
                      Case{"IsFlakyNow", kCrashedAt5, flaky(kCrashedAt5), Change::kFlaky, false},
                      Case{"IsStillFlaky", flaky(kCrashedAt5), flaky(kCrashedAt9), Change::kFlaky, true},
                      Case{"ExpectationIsNotMetNow", kPassed, unmet(kPassed), Change::kNone, false},
                      Case{"ExpectationIsStillNotMet", unmet(kPassed), unmet(kPassed), Change::kNone, true},
                      Case{"SomethingIsFoundNow", kPassed, found({"InvalidRead"}), Change::kNew, false},
                      Case{"TheSameIsFound", found({"InvalidRead", "Leak"}), found({"InvalidRead"}),
                           Change::kStillFailing, true},
                      Case{"MoreIsFound", found({"InvalidRead"}), found({"InvalidRead", "InvalidRead"}),
                           Change::kNew, false},
                      Case{"WhatCrashedHasFindings", kCrashedAt5, found({"InvalidRead"}), Change::kNew,
                           false}),
    [](const auto& one) { return std::string(one.param.name); });

TEST(Baseline, APluginThatItDoesNotHaveIsNew) {
  PluginResult result = resultOf("/lib/b.so", Verdict::kCrashed, 5);
  Baseline({kCrashedAt5}).apply(result);
  EXPECT_EQ(result.comparison->change, Change::kNew);
  EXPECT_FALSE(result.comparison->earlier);
  EXPECT_FALSE(result.isWanted);
}

TEST(Baseline, ANameThatIsNoUtf8IsFoundAsTheStreamHasIt) {
  PluginResult result = resultOf("/lib/\xFF.so", Verdict::kCrashed, 5);
  Baseline({resultOf("/lib/\xEF\xBF\xBD.so", Verdict::kCrashed, 5)}).apply(result);
  EXPECT_TRUE(result.isWanted);
}

TEST(Baseline, ChildrenAreComparedWithTheSameChild) {
  PluginResult before = kCrashedAt5;
  before.run.child = 1;
  PluginResult now = kCrashedAt5;
  now.run.child = 2;
  Baseline({before}).apply(now);
  EXPECT_EQ(now.comparison->change, Change::kNew);
}

// ---- Folders that have moved ------------------------------------------------------------------------------

std::vector<Run> runsOf(const std::vector<std::string>& bundles) {
  std::vector<Run> runs;
  for (const std::string& bundle : bundles) runs.emplace_back().bundle = bundle;
  return runs;
}

struct MovedCase {
  const char* name;
  std::vector<std::string> before;
  std::vector<std::string> now;
  /// Of each plug-in of today: the one that it is compared with, as "1" for the first; "-" for none.
  const char* comparedWith;
};

class BaselineLocate : public ::testing::TestWithParam<MovedCase> {};

TEST_P(BaselineLocate, FindsAPluginWhoseFolderHasMovedUnlessItMayBeAnother) {
  const MovedCase& row = GetParam();
  std::vector<PluginResult> before;
  for (std::size_t i = 0; i < row.before.size(); ++i)
    before.push_back(resultOf(row.before[i], Verdict::kCrashed, static_cast<int>(i) + 1));
  Baseline baseline(before);
  baseline.locate(runsOf(row.now));
  std::string comparedWith;
  for (const std::string& bundle : row.now) {
    PluginResult result = resultOf(bundle, Verdict::kCrashed, 9);
    baseline.apply(result);
    const auto& earlier = result.comparison->earlier;
    comparedWith += earlier ? std::to_string(*earlier->step) : "-";
    EXPECT_EQ(result.isWanted, earlier.has_value()) << bundle;
  }
  EXPECT_EQ(comparedWith, row.comparedWith);
}

INSTANTIATE_TEST_SUITE_P(
    , BaselineLocate,
    ::testing::Values(
        MovedCase{"TheSamePath", {"/old/a.so"}, {"/old/a.so"}, "1"},
        MovedCase{"AnotherFolder",
                  {"/old/build/a.so", "/old/build/b.so"},
                  {"/new/build/a.so", "/new/build/b.so"},
                  "12"},
        MovedCase{"OneOfSeveral", {"/old/a.so", "/old/b.so"}, {"/new/b.so"}, "2"},
        MovedCase{"AnotherName", {"/old/a.so"}, {"/new/b.so"}, "-"},
        MovedCase{"AnEndOfAName", {"/old/xa.so"}, {"/new/a.so"}, "-"},
        MovedCase{"TheFolderTellsThemApart",
                  {"/old/debug/a.so", "/old/release/a.so"},
                  {"/new/release/a.so", "/new/debug/a.so"},
                  "21"},
        MovedCase{"TwoThatItMayHaveBeen", {"/old/debug/a.so", "/old/release/a.so"}, {"/new/a.so"}, "-"},
        MovedCase{"TwoThatItMayHaveBecome", {"/old/a.so"}, {"/new/debug/a.so", "/new/release/a.so"}, "--"},
        MovedCase{"ACopyOfOneThatIsStillThere", {"/old/a.so"}, {"/old/a.so", "/new/a.so"}, "1-"},
        MovedCase{"OneCameBesideTheOneThatStays",
                  {"/old/debug/a.so", "/old/release/a.so"},
                  {"/old/debug/a.so", "/new/release/a.so"},
                  "12"}),
    [](const auto& one) { return std::string(one.param.name); });

TEST(Baseline, APluginThatHasMovedIsFoundForItsProcessorAlone) {
  PluginResult before = kCrashedAt5;
  before.run.target.processor = "i386";
  PluginResult now = resultOf("/new/a.so", Verdict::kCrashed, 5);
  now.run.target.processor = "x86_64";
  Baseline baseline({before});
  baseline.locate({now.run});
  baseline.apply(now);
  EXPECT_FALSE(now.comparison->earlier);
}

TEST(Baseline, TheChildrenOfAShellThatHasMovedGoWithIt) {
  const PluginResult shell = resultOf("/old/a.so", Verdict::kShell);
  PluginResult child = resultOf("/old/a.so", Verdict::kCrashed, 5);
  child.run.child = 7;
  Baseline baseline({shell, child});
  PluginResult now = child;
  now.run.bundle = "/new/a.so";
  baseline.locate({now.run});
  baseline.apply(now);
  EXPECT_EQ(now.comparison->change, Change::kStillFailing);
}

std::vector<std::string> gone(const std::vector<PluginResult>& before, const std::vector<PluginResult>& now,
                              const std::vector<std::string>& places, const Shard& shard = {}) {
  std::vector<PluginKey> keys;
  for (const PluginResult& result : now) keys.push_back(keyOf(result.run));
  std::vector<Run> runs;
  for (const PluginResult& result : now) runs.push_back(result.run);
  Baseline baseline(before);
  baseline.locate(runs);
  std::vector<std::string> names;
  for (const Run& run : baseline.gone(keys, places, shard)) names.push_back(nameOf(run, true));
  return names;
}

TEST(BaselineGone, PluginsOfThePlacesThatAreNoLongerThere) {
  const std::vector<PluginResult> before = {
      resultOf("/lib/a.so", Verdict::kPassed), resultOf("/lib/sub/b.so", Verdict::kCrashed),
      resultOf("/library/c.so", Verdict::kPassed), resultOf("/lib/skipped.so", Verdict::kSkipped)};
  EXPECT_THAT(gone(before, {kPassed}, {"/lib"}), ElementsAre("/lib/sub/b.so"));
  EXPECT_THAT(gone(before, {kPassed}, {"/"}), ElementsAre("/lib/sub/b.so", "/library/c.so"));
  // Files that are named on the command line are all that is tried.
  EXPECT_THAT(gone(before, {kPassed}, {}), IsEmpty());
}

TEST(BaselineGone, ChildrenOfAShellThatIsStillThere) {
  PluginResult child = resultOf("/lib/a.so", Verdict::kPassed);
  child.run.child = 7;
  PluginResult orphan = resultOf("/lib/b.so", Verdict::kPassed);
  orphan.run.child = 7;
  EXPECT_THAT(gone({kPassed, child, orphan}, {kPassed}, {}), ElementsAre("/lib/a.so #7"));
}

TEST(BaselineGone, PluginsOfAFolderThatHasMoved) {
  const std::vector<PluginResult> before = {resultOf("/old/build/a.so", Verdict::kPassed),
                                            resultOf("/old/build/b.so", Verdict::kPassed),
                                            resultOf("/old/other/c.so", Verdict::kPassed)};
  const std::vector<PluginResult> now = {resultOf("/new/build/a.so", Verdict::kPassed)};
  EXPECT_THAT(gone(before, now, {"/new/build"}), ElementsAre("/old/build/b.so"));
}

TEST(BaselineGone, ChildrenOfAShellOfAnotherPartAreNotLookedFor) {
  PluginResult child = resultOf("/lib/a.so", Verdict::kPassed);
  child.run.child = 7;
  const Shard first = {1, 2};
  const Shard second = {2, 2};
  const Shard& own = isInShard(first, "/lib/a.so") ? first : second;
  const Shard& other = isInShard(first, "/lib/a.so") ? second : first;
  EXPECT_THAT(gone({kPassed, child}, {kPassed}, {}, own), ElementsAre("/lib/a.so #7"));
  EXPECT_THAT(gone({kPassed, child}, {kPassed}, {}, other), IsEmpty());
}

TEST(BaselineGone, OnlyOfThePartThatIsTried) {
  std::vector<PluginResult> before;
  for (int i = 0; i < 20; ++i) before.push_back(resultOf("/lib/" + std::to_string(i), Verdict::kPassed));
  const std::size_t first = gone(before, {}, {"/lib"}, {1, 2}).size();
  const std::size_t second = gone(before, {}, {"/lib"}, {2, 2}).size();
  EXPECT_EQ(first + second, 20U);
  EXPECT_GT(first, 0U);
  EXPECT_GT(second, 0U);
}

}  // namespace
