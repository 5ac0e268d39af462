// SPDX-License-Identifier: MIT
#include <limits>

#include <gmock/gmock.h>

#include "scanner/report/merge.h"
#include "scanner/report/terminal.h"
#include "tests/scanner/report_fixture.h"

using namespace scanner;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

namespace {

std::vector<std::string> namesAndVerdicts(const MergedReport& merged) {
  std::vector<std::string> all;
  for (const PluginResult& result : merged.report.results)
    all.push_back(nameOf(result.run, true) + " " + rowOf(result.judgement.verdict).word);
  return all;
}

TEST(Merge, PartsInAnyOrderMakeTheReportOfOneMachine) {
  PluginResult shell = resultOf("/lib/b.so", Verdict::kShell);
  PluginResult first = resultOf("/lib/b.so", Verdict::kPassed);
  first.run.child = -7;
  PluginResult second = first;
  second.run.child = 1001;
  const PluginResult a = resultOf("/lib/a.so", Verdict::kPassed);
  const PluginResult c = resultOf("/lib/c.so", Verdict::kCrashed, 5);
  RecordedScan other = scanOf("2.jsonl", {c, a}, {2, 2});
  other.report.started.notes = {"not searched: /x"};
  other.report.started.machine = "other";
  const MergedReport merged = merge({other, scanOf("1.jsonl", {shell, second, first}, {1, 2})});
  EXPECT_THAT(namesAndVerdicts(merged),
              ElementsAre("/lib/a.so passed", "/lib/b.so shell", "/lib/b.so #-7 passed",
                          "/lib/b.so #1001 passed", "/lib/c.so crashed"));
  EXPECT_THAT(merged.problems, IsEmpty());
  EXPECT_TRUE(merged.isWhole);
  const ScanStarted& started = merged.report.started;
  EXPECT_EQ(started.machine, "other, box");
  EXPECT_EQ(started.shard.parts, 1U);
  EXPECT_THAT(started.notes, ElementsAre("not searched: /x"));
  EXPECT_THAT(started.places, ElementsAre("/lib"));
  EXPECT_EQ(merged.report.ended->unwanted, 1U);
  EXPECT_EQ(merged.report.ended->status, 1);
  EXPECT_EQ(merged.report.ended->counts.at("passed"), 3U);
}

TEST(Merge, TimesSpanAllScans) {
  RecordedScan early = scanOf("1", {}, {1, 2});
  early.report.started.time = 100;
  early.report.ended->time = 160;
  early.report.ended->wallSeconds = 60;
  RecordedScan late = scanOf("2", {}, {2, 2});
  late.report.started.time = 150;
  late.report.ended->time = 170;
  late.report.ended->wallSeconds = 20;
  const MergedReport merged = merge({late, early});
  EXPECT_EQ(merged.report.started.time, 100);
  EXPECT_EQ(merged.report.ended->time, 170);
  EXPECT_EQ(merged.report.ended->wallSeconds, 60);
}

TEST(Merge, MissingPartsAreNamedAndTheReportIsNotAsWanted) {
  const MergedReport merged = merge({scanOf("1", {}, {1, 4}), scanOf("3", {}, {3, 4})});
  EXPECT_THAT(merged.problems, ElementsAre("missing: parts 2, 4 of 4"));
  EXPECT_THAT(merged.report.started.notes, ElementsAre("missing: parts 2, 4 of 4"));
  EXPECT_EQ(merged.report.ended->status, 1);
  EXPECT_THAT(merge({scanOf("1", {}, {2, 2})}).problems, ElementsAre("missing: part 1 of 2"));
}

TEST(Merge, AStreamThatClaimsMoreNumbersThanThereCanBeEndsSoon) {
  const unsigned most = std::numeric_limits<unsigned>::max();
  EXPECT_THAT(merge({scanOf("1", {}, {most, most})}).problems,
              ElementsAre("missing: parts 1, 2, 3, 4, 5, 6, 7, 8, 9, 10 and 4294967284 more of 4294967295"));
}

TEST(Merge, AScanThatWasCutOffNamesWhatWasUnderWay) {
  RecordedScan scan = scanOf("1.jsonl", {resultOf("/lib/a.so", Verdict::kPassed)});
  scan.report.ended.reset();
  scan.underWay.push_back(resultOf("/lib/b.so", Verdict::kPassed).run);
  const MergedReport merged = merge({scan});
  EXPECT_THAT(
      merged.problems,
      ElementsAre("1.jsonl (box) is cut off: the scan was killed, or its results could not be written; "
                  "under way: /lib/b.so"));
  EXPECT_EQ(merged.report.ended->status, 1);
  EXPECT_TRUE(merged.report.ended->isInterrupted);
}

TEST(Merge, AnInterruptedScanAndOneThatLacksSomethingAreNotAsWanted) {
  RecordedScan interrupted = scanOf("1.jsonl", {}, {1, 2});
  interrupted.report.ended->isInterrupted = true;
  interrupted.report.ended->status = 130;
  RecordedScan lacking = scanOf("2.jsonl", {}, {2, 2});
  lacking.report.ended->status = 1;
  const MergedReport merged = merge({interrupted, lacking});
  EXPECT_THAT(
      merged.problems,
      ElementsAre(
          "1.jsonl (box, part 1 of 2) was interrupted: not every plug-in was tried",
          "2.jsonl (box, part 2 of 2) lacks a plug-in that was expected, or the children of a shell"));
  EXPECT_EQ(merged.report.ended->status, 1);
}

TEST(Merge, DuplicatesAreNamedAndCountedOnce) {
  const std::vector<PluginResult> results = {resultOf("/lib/a.so", Verdict::kPassed),
                                             resultOf("/lib/b.so", Verdict::kPassed)};
  const MergedReport merged = merge({scanOf("1", results), scanOf("2", results)});
  EXPECT_THAT(merged.problems,
              ElementsAre("twice, with the same verdict, in 1 (box) and in 2 (box): /lib/a.so, /lib/b.so"));
  EXPECT_EQ(merged.report.results.size(), 2U);
  EXPECT_EQ(merged.report.started.plugins, 2U);
  EXPECT_EQ(merged.report.ended->status, 0);
}

TEST(Merge, AThousandDuplicatesMakeOneSentence) {
  std::vector<PluginResult> results;
  for (int i = 0; i < 1000; ++i) results.push_back(resultOf("/lib/" + std::to_string(i), Verdict::kPassed));
  const MergedReport merged = merge({scanOf("1", results), scanOf("2", results)});
  ASSERT_EQ(merged.problems.size(), 1U);
  EXPECT_THAT(merged.problems[0], HasSubstr(" and 990 more"));
}

struct Contradiction {
  const char* name;
  Verdict better;
  Verdict worse;
};

class MergeContradictions : public ::testing::TestWithParam<Contradiction> {};

TEST_P(MergeContradictions, TakeTheWorseVerdictWhateverTheOrder) {
  const PluginResult better = resultOf("/lib/a.so", GetParam().better);
  const PluginResult worse = resultOf("/lib/a.so", GetParam().worse);
  for (const bool isWorseFirst : {false, true}) {
    const MergedReport merged = isWorseFirst ? merge({scanOf("1", {worse}), scanOf("2", {better})})
                                             : merge({scanOf("1", {better}), scanOf("2", {worse})});
    const std::string word = rowOf(GetParam().worse).word;
    EXPECT_THAT(namesAndVerdicts(merged), ElementsAre("/lib/a.so " + word));
    ASSERT_EQ(merged.problems.size(), 1U);
    EXPECT_THAT(merged.problems[0], HasSubstr("contradiction: /lib/a.so: "));
    EXPECT_THAT(merged.problems[0], HasSubstr("; taken: " + word));
    EXPECT_THAT(merged.problems[0], HasSubstr(word + " in " + (isWorseFirst ? "1" : "2") + " (box)"));
  }
}

INSTANTIATE_TEST_SUITE_P(
    , MergeContradictions,
    ::testing::Values(Contradiction{"CrashedAndPassed", Verdict::kPassed, Verdict::kCrashed},
                      Contradiction{"CrashedAndFailed", Verdict::kFailed, Verdict::kCrashed},
                      Contradiction{"HungAndNotRun", Verdict::kNotRun, Verdict::kHung},
                      Contradiction{"NotRunAndPassed", Verdict::kPassed, Verdict::kNotRun},
                      Contradiction{"PassedAndSkipped", Verdict::kSkipped, Verdict::kPassed},
                      Contradiction{"ArchitectureAndPassed", Verdict::kPassed, Verdict::kWrongArchitecture}),
    [](const auto& one) { return std::string(one.param.name); });

TEST(Merge, AResultThatIsNotWantedIsWorseThanAnyThatIs) {
  PluginResult expected = resultOf("/lib/a.so", Verdict::kCrashed);
  expected.isWanted = true;
  PluginResult mended = resultOf("/lib/a.so", Verdict::kPassed);
  mended.isWanted = false;
  const MergedReport merged = merge({scanOf("1", {expected}), scanOf("2", {mended})});
  EXPECT_THAT(namesAndVerdicts(merged), ElementsAre("/lib/a.so passed"));
  EXPECT_EQ(merged.report.ended->status, 1);
}

TEST(Merge, TheSamePathOnMachinesOfTwoArchitecturesIsTwoPlugins) {
  PluginResult first = resultOf("/lib/a.so", Verdict::kPassed);
  first.run.target.processor = "x86_64";
  PluginResult second = resultOf("/lib/a.so", Verdict::kCrashed);
  second.run.target.processor = "aarch64";
  const MergedReport merged = merge({scanOf("1", {first}), scanOf("2", {second})});
  EXPECT_THAT(namesAndVerdicts(merged), ElementsAre("/lib/a.so crashed", "/lib/a.so passed"));
  EXPECT_THAT(merged.problems, IsEmpty());
}

TEST(Merge, ScansThatCannotBeComparedWellAreNamed) {
  RecordedScan other = scanOf("2", {}, {2, 2});
  other.report.started.version = "9";
  other.report.started.limits.stepInSeconds = 1;
  RecordedScan first = scanOf("1", {}, {1, 2});
  first.report.started.version = "8";
  EXPECT_THAT(merge({first, other}).problems,
              ElementsAre("different versions: 8 in 1 (box, part 1 of 2), 9 in 2 (box, part 2 of 2)",
                          HasSubstr("different limits: 20 s a step, ")));
}

}  // namespace
