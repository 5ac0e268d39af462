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
                      Case{"SomethingIsFoundNow", kPassed, found({"InvalidRead"}), Change::kNone, false},
                      Case{"TheSameIsFound", found({"InvalidRead", "Leak"}), found({"InvalidRead"}),
                           Change::kNone, true},
                      Case{"MoreIsFound", found({"InvalidRead"}), found({"InvalidRead", "InvalidRead"}),
                           Change::kNone, false}),
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

std::vector<std::string> gone(const std::vector<PluginResult>& before, const std::vector<PluginResult>& now,
                              const std::vector<std::string>& places, const Shard& shard = {}) {
  std::vector<PluginKey> keys;
  for (const PluginResult& result : now) keys.push_back(keyOf(result.run));
  std::vector<std::string> names;
  for (const Run& run : Baseline(before).gone(keys, places, shard)) names.push_back(nameOf(run, true));
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
