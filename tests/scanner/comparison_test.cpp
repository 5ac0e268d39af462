// SPDX-License-Identifier: MIT
#include <gmock/gmock.h>

#include "scanner/events/comparison.h"

using namespace scanner;

namespace {

using Change = Comparison::Change;

PluginResult result(Verdict verdict) {
  PluginResult one;
  one.judgement.verdict = verdict;
  one.isWanted = rowOf(verdict).isGood;
  return one;
}

struct Case {
  const char* name;
  Verdict now;
  std::optional<Verdict> earlier;
  bool isUnchanged;
  Change change;
};
class CompareTable : public ::testing::TestWithParam<Case> {};

TEST_P(CompareTable, NamesTheChange) {
  const Case& row = GetParam();
  const PluginResult earlier = row.earlier ? result(*row.earlier) : PluginResult{};
  const Comparison comparison = compare(result(row.now), row.earlier ? &earlier : nullptr, row.isUnchanged);
  EXPECT_STREQ(nameOfChange(comparison.change), nameOfChange(row.change));
}

using V = Verdict;
INSTANTIATE_TEST_SUITE_P(
    Compare, CompareTable,
    ::testing::Values(Case{"APassForTheFirstTime", V::kPassed, {}, false, Change::kNone},
                      Case{"AFailureForTheFirstTime", V::kCrashed, {}, false, Change::kNew},
                      Case{"APassAsBefore", V::kPassed, V::kPassed, false, Change::kNone},
                      Case{"AFailureAfterAPass", V::kCrashed, V::kPassed, false, Change::kNew},
                      Case{"AnotherFailure", V::kHung, V::kCrashed, false, Change::kNew},
                      Case{"TheSameFailure", V::kCrashed, V::kCrashed, false, Change::kStillFailing},
                      Case{"TheSameFailureOfTheSameFile", V::kCrashed, V::kCrashed, true,
                           Change::kStillFailing},
                      Case{"APassAfterAFailure", V::kPassed, V::kCrashed, false, Change::kMended},
                      Case{"AShellAfterAFailure", V::kShell, V::kFailed, false, Change::kMended},
                      Case{"AFailureAfterAPassOfTheSameFile", V::kCrashed, V::kPassed, true, Change::kFlaky},
                      Case{"APassAfterAFailureOfTheSameFile", V::kPassed, V::kCrashed, true, Change::kFlaky},
                      Case{"AnotherFailureOfTheSameFile", V::kHung, V::kCrashed, true, Change::kFlaky},
                      Case{"SkippedAfterAFailure", V::kSkipped, V::kCrashed, true, Change::kNone},
                      Case{"SkippedAfterAPass", V::kSkipped, V::kPassed, true, Change::kNone},
                      Case{"AFailureAfterBeingSkipped", V::kCrashed, V::kSkipped, true, Change::kNew},
                      Case{"APassAfterBeingSkipped", V::kPassed, V::kSkipped, true, Change::kNone},
                      Case{"NotRunAfterAPass", V::kNotRun, V::kPassed, true, Change::kNone},
                      Case{"NotRunAgain", V::kNotRun, V::kNotRun, true, Change::kNone},
                      Case{"APassAfterNotBeingRun", V::kPassed, V::kNotRun, true, Change::kNone},
                      Case{"AWorkerWasRemoved", V::kWrongArchitecture, V::kPassed, true, Change::kNew},
                      Case{"AWorkerIsStillMissing", V::kWrongArchitecture, V::kWrongArchitecture, true,
                           Change::kStillFailing},
                      Case{"AWorkerWasInstalled", V::kPassed, V::kWrongArchitecture, true, Change::kMended}),
    [](const auto& parameter) { return std::string(parameter.param.name); });

TEST(Compare, RepetitionsThatEndDifferentlyAreFlakyWhateverWasBefore) {
  PluginResult now = result(Verdict::kCrashed);
  now.repetitions = Repetitions{3, {{"passed", 1}, {"crashed at 5", 2}}};
  const PluginResult earlier = result(Verdict::kCrashed);
  EXPECT_EQ(compare(now, nullptr, false).change, Change::kFlaky);
  EXPECT_EQ(compare(now, &earlier, false).change, Change::kFlaky);
  now.repetitions = Repetitions{3, {{"crashed at 5", 3}}};
  EXPECT_EQ(compare(now, &earlier, false).change, Change::kStillFailing);
}

TEST(Compare, AFailureThatIsExpectedIsNoNews) {
  PluginResult now = result(Verdict::kCrashed);
  now.isWanted = true;
  const PluginResult earlier = result(Verdict::kPassed);
  EXPECT_EQ(compare(now, &earlier, false).change, Change::kNone);
  EXPECT_EQ(compare(now, nullptr, false).change, Change::kNone);
}

TEST(Compare, APassInPlaceOfAnExpectedFailureIsMended) {
  PluginResult now = result(Verdict::kPassed);
  now.isWanted = false;
  PluginResult earlier = result(Verdict::kCrashed);
  earlier.isWanted = true;
  EXPECT_EQ(compare(now, &earlier, false).change, Change::kMended);
}

/// Passed under a tool that has found this; without a tool where there is no list.
PluginResult under(const char* tool, const std::optional<std::vector<std::string>>& kinds) {
  PluginResult one = result(V::kPassed);
  if (!kinds) return one;
  one.diagnosis.emplace();
  one.diagnosis->tool = tool;
  for (const std::string& kind : *kinds) one.diagnosis->findings.push_back({kind, "text", {}});
  one.isWanted = kinds->empty();
  return one;
}

struct FindingsCase {
  const char* name;
  std::optional<std::vector<std::string>> now;
  std::optional<std::vector<std::string>> earlier;
  Change change;           ///< Of another file,
  Change changeUnchanged;  ///< and of the same with the same options.
};
class CompareFindings : public ::testing::TestWithParam<FindingsCase> {};

TEST_P(CompareFindings, OfAPluginThatPassesAreAFailure) {
  const FindingsCase& row = GetParam();
  const PluginResult now = under("memcheck", row.now);
  const PluginResult earlier = under("memcheck", row.earlier);
  EXPECT_STREQ(nameOfChange(compare(now, &earlier, false).change), nameOfChange(row.change));
  EXPECT_STREQ(nameOfChange(compare(now, &earlier, true).change), nameOfChange(row.changeUnchanged));
}

using Kinds = std::vector<std::string>;
INSTANTIATE_TEST_SUITE_P(
    Compare, CompareFindings,
    ::testing::Values(
        FindingsCase{"NothingAndNothing", Kinds{}, Kinds{}, Change::kNone, Change::kNone},
        FindingsCase{"TheFirst", Kinds{"Read"}, Kinds{}, Change::kNew, Change::kFlaky},
        FindingsCase{"TheSame", Kinds{"Read"}, Kinds{"Read"}, Change::kStillFailing, Change::kStillFailing},
        FindingsCase{"Fewer", Kinds{"Read"}, Kinds{"Read", "Write"}, Change::kStillFailing,
                     Change::kStillFailing},
        FindingsCase{"More", Kinds{"Read", "Read"}, Kinds{"Read"}, Change::kNew, Change::kFlaky},
        FindingsCase{"OfAnotherKind", Kinds{"Write"}, Kinds{"Read"}, Change::kNew, Change::kFlaky},
        FindingsCase{"NoneAnyMore", Kinds{}, Kinds{"Read"}, Change::kMended, Change::kFlaky},
        FindingsCase{"NobodyLookedBefore", Kinds{"Read"}, {}, Change::kNew, Change::kNew},
        FindingsCase{"NobodyLooksAnyMore", {}, Kinds{"Read"}, Change::kNone, Change::kNone}),
    [](const auto& parameter) { return std::string(parameter.param.name); });

TEST(Compare, FindingsOfAnotherToolAreNotThoseOfThisOne) {
  const PluginResult earlier = under("strace", Kinds{"Read"});
  EXPECT_EQ(compare(under("memcheck", Kinds{"Read"}), &earlier, false).change, Change::kNew);
  EXPECT_EQ(compare(under("memcheck", Kinds{}), &earlier, false).change, Change::kNone);
}

TEST(Compare, ARunUnderTheToolThatIsNotWholeMendsNothing) {
  const PluginResult earlier = under("memcheck", Kinds{"Read"});
  PluginResult now = under("memcheck", Kinds{});
  now.diagnosis->problem = "it was ended before the run was";
  EXPECT_EQ(compare(now, &earlier, false).change, Change::kNone);
}

TEST(Compare, FindingsThatAreNotThePluginsOrAreExpectedAreNoNews) {
  const PluginResult earlier = under("memcheck", Kinds{});
  PluginResult now = under("memcheck", Kinds{"Read"});
  now.diagnosis->findings[0].isInPlugin = false;
  EXPECT_EQ(compare(now, &earlier, false).change, Change::kNone);
  now = under("memcheck", Kinds{"Read"});
  now.expected = Expectation{"passed", {}, "known", true};
  now.isWanted = true;
  EXPECT_EQ(compare(now, &earlier, false).change, Change::kNone);
  EXPECT_EQ(compare(now, nullptr, false).change, Change::kNone);
}

TEST(Compare, FindingsAreNoPartOfAVerdictThatIsNotGood) {
  PluginResult earlier = result(V::kCrashed);
  PluginResult now = under("memcheck", Kinds{"Read"});
  now.judgement.verdict = V::kCrashed;
  EXPECT_EQ(compare(now, &earlier, false).change, Change::kStillFailing);
  EXPECT_EQ(compare(under("memcheck", Kinds{"Read"}), &earlier, false).change, Change::kNew);
  EXPECT_EQ(compare(under("memcheck", Kinds{"Read"}), nullptr, false).change, Change::kNew);
}

TEST(Compare, SaysHowAndWhenItEndedBefore) {
  PluginResult earlier = result(Verdict::kCrashed);
  earlier.judgement.step = 5;
  earlier.seen = RunSeen{};
  earlier.seen->startedAt = 1234.5;
  const Comparison comparison = compare(result(Verdict::kPassed), &earlier, false);
  ASSERT_TRUE(comparison.earlier);
  EXPECT_EQ(comparison.earlier->verdict, "crashed");
  EXPECT_EQ(comparison.earlier->step, 5);
  EXPECT_EQ(comparison.earlier->time, 1234.5);
}

TEST(Compare, SaysNoStepBeforeTheFirstAndNothingOfAPluginThatWasSkipped) {
  const PluginResult notLoadable = result(Verdict::kNotLoadable);
  EXPECT_EQ(compare(result(Verdict::kPassed), &notLoadable, false).earlier->step, std::nullopt);
  const PluginResult skipped = result(Verdict::kSkipped);
  EXPECT_FALSE(compare(result(Verdict::kPassed), &skipped, false).earlier);
  EXPECT_FALSE(compare(result(Verdict::kPassed), nullptr, false).earlier);
}

}  // namespace
