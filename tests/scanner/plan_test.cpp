// SPDX-License-Identifier: MIT
#include <fstream>
#include <set>

#include <gmock/gmock.h>

#include "scanner/plan/plugin_list.h"
#include "scanner/plan/run_list.h"
#include "tests/shared/temporary_directory.h"

using namespace scanner;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

namespace {

// ---- Lists ------------------------------------------------------------------------------------------------

class Lists {
 public:
  std::string write(const std::string& text) {
    const std::string path = folder.path() / "list";
    std::ofstream(path, std::ios::binary) << text;
    return path;
  }
  /// What is wrong with a list, without the file's name; "nothing" for one that is fine.
  template <class Read>
  std::string problemOf(const std::string& text, Read read) {
    const std::string path = write(text);
    try {
      read(path);
    } catch (const BrokenList& error) {
      return std::string(error.what()).substr(path.size() + 2);
    }
    return "nothing";
  }

 private:
  TemporaryDirectory folder;
};

PluginList listOf(const PluginRow& row) {
  PluginList list("list");
  list.add(row);
  return list;
}

PluginList readExpected(const std::string& path) { return readExpectations(path, {"passed", "crashed"}); }

struct Broken {
  const char* name;
  bool isSkipList;
  const char* text;
  const char* problem;
};
class BrokenLists : public ::testing::TestWithParam<Broken> {};

TEST_P(BrokenLists, NameTheLine) {
  const Broken& list = GetParam();
  EXPECT_EQ(Lists().problemOf(list.text, list.isSkipList ? readSkipList : readExpected), list.problem);
}

constexpr const char* kSkipRow = "a row is PLUG-IN, a tab, and the reason why it is skipped";
const std::string kSecondLine = std::string("line 2: ") + kSkipRow;
INSTANTIATE_TEST_SUITE_P(
    Rows, BrokenLists,
    ::testing::Values(
        Broken{"WithoutAReason", true, "a.so\tbroken\nb.so\n", kSecondLine.c_str()},
        Broken{"WithAnEmptyReason", true, "a.so\tbroken\nb.so\t\n", kSecondLine.c_str()},
        Broken{"WithBlanksForATab", true, "# c\nb.so  broken", kSecondLine.c_str()},
        Broken{"WithTooMuch", true, "\nb.so\tbroken\tmore\n", kSecondLine.c_str()},
        Broken{"WithoutAPlugin", true, "\tbroken\n", "line 1: no plug-in is named"},
        Broken{"WithoutAPluginButAChild", true, "#*\tbroken\n#1\t\n", "nothing"},
        Broken{"WithoutAVerdict", false, "a.so\n",
               "line 1: a row is PLUG-IN, VERDICT, STEP or -, and a reason, with tabs between them"},
        Broken{"WithFiveFields", false, "a\tpassed\t-\tx\ty\n",
               "line 1: a row is PLUG-IN, VERDICT, STEP or -, and a reason, with tabs between them"},
        Broken{"WithAnUnknownVerdict", false, "a.so\tpassed\n\n\nb.so\tPassed\n",
               "line 4: \"Passed\" is no verdict"},
        Broken{"WithAnUnknownStep", false, "a.so\tcrashed\tfive\n", "line 1: \"five\" is no step"},
        Broken{"WithAStepBeyondNumbers", false, "a.so\tcrashed\t99999999999\n",
               "line 1: \"99999999999\" is no step"},
        Broken{"WithAStepBelow0", false, "a.so\tcrashed\t-1\n", "line 1: \"-1\" is no step"}),
    [](const auto& parameter) { return std::string(parameter.param.name); });

TEST(Lists, CommentsEmptyLinesAndLineEndsOfOtherSystemsDoNotCount) {
  Lists lists;
  const PluginList list = readSkipList(lists.write("# x\ty\r\n\r\n  \t \na.so\tbroken\r\nb.so\tslow"));
  ASSERT_EQ(list.rows.size(), 2U);
  EXPECT_EQ(list.rows[0].reason, "broken");
  EXPECT_EQ(list.rows[1].line, 5U);
}

TEST(Lists, StepAndReasonOfAnExpectationMayBeMissing) {
  Lists lists;
  const PluginList list =
      readExpected(lists.write("a\tpassed\nb\tcrashed\t5\nc\tcrashed\t-\tknown\nd\tcrashed\t\tknown\n"));
  ASSERT_EQ(list.rows.size(), 4U);
  EXPECT_EQ(list.rows[0].step, std::nullopt);
  EXPECT_EQ(list.rows[1].step, 5);
  EXPECT_EQ(list.rows[2].step, std::nullopt);
  EXPECT_EQ(list.rows[3].reason, "known");
}

TEST(Lists, AListThatIsNotThereSaysSo) {
  EXPECT_THROW(
      {
        try {
          readSkipList("/nonexistent/list");
        } catch (const BrokenList& error) {
          EXPECT_STREQ(error.what(), "/nonexistent/list: No such file or directory");
          throw;
        }
      },
      BrokenList);
  EXPECT_THROW(readSkipList("/tmp"), BrokenList);
}

struct Match {
  const char* row;
  const char* bundle;
  std::optional<std::int32_t> child;
  bool matches;
};
class Rows : public ::testing::TestWithParam<Match> {};

TEST_P(Rows, Match) {
  Lists lists;
  const PluginList list = readSkipList(lists.write(std::string(GetParam().row) + "\treason\n"));
  EXPECT_EQ(list.find(GetParam().bundle, GetParam().child) != nullptr, GetParam().matches)
      << GetParam().row << " and " << GetParam().bundle;
}

INSTANTIATE_TEST_SUITE_P(
    Patterns, Rows,
    ::testing::Values(Match{"a.so", "/lib/a.so", {}, true}, Match{"a.so", "/lib/ba.so", {}, false},
                      Match{"/lib/a.so", "/lib/a.so", {}, true}, Match{"/lib/a.so", "/x/lib/a.so", {}, false},
                      Match{"lib/a.so", "/x/lib/a.so", {}, true},
                      Match{"lib/a.so", "/x/glib/a.so", {}, false},
                      Match{"x/lib/a.so", "/x/lib/a.so", {}, true},
                      Match{"y/x/lib/a.so", "/x/lib/a.so", {}, false}, Match{"*.so", "/lib/a.so", {}, true},
                      Match{"l*.so", "/lib/a.so", {}, false}, Match{"/lib/*", "/lib/x/a.so", {}, true},
                      Match{"[ab].so", "/lib/b.so", {}, true}, Match{"?.so", "/lib/bb.so", {}, false},
                      Match{"\xFF*", "/lib/\xFF\xFE", {}, true}, Match{"a.so", "/lib/a.so", 1, false},
                      Match{"a.so#1", "/lib/a.so", 1, true}, Match{"a.so#1", "/lib/a.so", {}, false},
                      Match{"a.so#1", "/lib/a.so", 2, false}, Match{"a.so#-7", "/lib/a.so", -7, true},
                      Match{"a.so#007", "/lib/a.so", 7, true}, Match{"a.vst/", "/lib/a.vst", {}, true},
                      Match{"/lib/a.vst/#7", "/lib/a.vst", 7, true}, Match{"a.so#*", "/lib/a.so", 2, true},
                      Match{"a.so#*", "/lib/a.so", {}, false}, Match{"a#b.so", "/lib/a#b.so", {}, true}));

TEST(PluginListMatching, GivesNamesAndPatternsInTheOrderOfTheList) {
  Lists lists;
  const PluginList list = readSkipList(
      lists.write("*\t1\nb.so\t2\na.so\t3\nlib/a.so\t4\n/lib[x/]a.so\t5\n/*/a.so\t6\na.s?\t7\na\\.so\t8\n"));
  std::string reasons;
  for (const PluginRow* row : list.matching("/lib/a.so", {})) reasons += row->reason;
  EXPECT_EQ(reasons, "1345678");
}

TEST(PluginListFind, TheFirstRowThatMatchesDecides) {
  Lists lists;
  const PluginList list = readExpected(lists.write("a.so\tcrashed\n*\tpassed\n"));
  EXPECT_EQ(list.find("/lib/a.so", {})->verdict, "crashed");
  EXPECT_EQ(list.find("/lib/b.so", {})->verdict, "passed");
}

// ---- Plans ------------------------------------------------------------------------------------------------

Module module(const std::string& bundle, const std::string& processor,
              Target::System system = Target::System::kLinux) {
  return {bundle, bundle, {}, {system, processor}};
}

const WorkersByProcessor kWorkers = {{"i386", {"/32/worker", "/32/describe"}},
                                     {"x86_64", {"/64/worker", "/64/describe"}}};

RunList plan(
    const std::vector<Module>& modules, const PluginList& skipped = {}, const Shard& shard = {},
    const std::function<double(const Module&)>& secondsOf = [](const Module&) { return 0.0; }) {
  return planRuns(modules, kWorkers, "x86_64", skipped, shard, secondsOf);
}

std::vector<std::string> bundlesOf(const RunList& list) {
  std::vector<std::string> bundles;
  for (const Run& run : list.runs) bundles.push_back(run.bundle);
  return bundles;
}

TEST(PlanRuns, EachModuleGetsTheWorkerOfItsProcessorAndAFileThatIsNoneTheScansOwn) {
  const RunList list = plan({module("/a", "i386"), module("/b", "x86_64"), module("/c", "")});
  ASSERT_EQ(list.runs.size(), 3U);
  EXPECT_EQ(list.runs[0].workers.worker, "/32/worker");
  EXPECT_EQ(list.runs[1].workers.describe, "/64/describe");
  EXPECT_EQ(list.runs[2].workers.worker, "/64/worker");
  EXPECT_THAT(list.notRun, IsEmpty());
}

TEST(PlanRuns, AModuleWithoutAWorkerIsOfTheWrongArchitectureAndNamesIt) {
  const RunList list = plan({module("/a", "aarch64"), module("/b", "x86_64", Target::System::kMacOs),
                             module("/c", "i386", Target::System::kWindows)});
  std::vector<std::string> reasons;
  for (const NotRun& one : list.notRun) {
    EXPECT_EQ(one.why, NotRun::Why::kWrongArchitecture);
    reasons.push_back(one.reason);
  }
  EXPECT_THAT(reasons, ElementsAre("built for Linux on aarch64, for which no worker is installed",
                                   "built for macOS on x86_64", "built for Windows on i386"));
  EXPECT_THAT(list.runs, IsEmpty());
}

TEST(PlanRuns, WhatTheListSkipsIsNotRunWhateverItIsBuiltFor) {
  PluginRow row;
  row.pattern = "/a";
  row.reason = "needs a licence";
  const RunList list = plan({module("/a", "aarch64"), module("/b", "x86_64")}, listOf(row));
  ASSERT_EQ(list.notRun.size(), 1U);
  EXPECT_EQ(list.notRun[0].why, NotRun::Why::kSkipped);
  EXPECT_EQ(list.notRun[0].reason, "needs a licence");
  EXPECT_THAT(bundlesOf(list), ElementsAre("/b"));
}

TEST(PlanRuns, UnknownDurationsGoFirstThenTheLongest) {
  const std::map<std::string, double> seconds = {{"/a", 1}, {"/b", 0}, {"/c", 9}, {"/d", 0}, {"/e", 5}};
  std::vector<Module> modules;
  for (const auto& [bundle, ignored] : seconds) modules.push_back(module(bundle, "x86_64"));
  const RunList list = plan(modules, {}, {}, [&](const Module& one) { return seconds.at(one.bundle); });
  EXPECT_THAT(bundlesOf(list), ElementsAre("/b", "/d", "/c", "/e", "/a"));
}

TEST(PlanRuns, EachPluginFallsToExactlyOnePart) {
  std::vector<Module> modules;
  for (int i = 0; i < 300; ++i) modules.push_back(module("/lib/" + std::to_string(i), "x86_64"));
  std::multiset<std::string> all;
  for (unsigned part = 1; part <= 3; ++part) {
    const std::vector<std::string> bundles = bundlesOf(plan(modules, {}, {part, 3}));
    EXPECT_THAT(bundles.size(), ::testing::AllOf(::testing::Ge(60U), ::testing::Le(140U)));
    all.insert(bundles.begin(), bundles.end());
  }
  EXPECT_EQ(all.size(), 300U);
  EXPECT_EQ(std::set<std::string>(all.begin(), all.end()).size(), 300U);
}

TEST(IsInShard, ThePartsAreTheSameOnEveryMachine) {
  std::string parts;
  for (const char* bundle : {"/usr/lib/vst/a.so", "/usr/lib/vst/b.so", "/usr/lib/vst/c.so", "/x"}) {
    for (unsigned part = 1; part <= 5; ++part) {
      if (isInShard({part, 5}, bundle)) parts += std::to_string(part);
    }
  }
  EXPECT_EQ(parts, "4535");
}

TEST(RunsOfChildren, EachIdentifierIsRunOnceInTheShellsOrderBySameWorker) {
  const scanner::Run shell = plan({module("/shell", "i386")}).runs.at(0);
  PluginRow row;
  row.pattern = "shell";
  row.child = "3";
  row.reason = "slow";
  const RunList list =
      runsOfChildren(shell, {{7, "Seven"}, {-1, "Minus"}, {7, "Again"}, {3, "Three"}}, listOf(row));
  ASSERT_EQ(list.runs.size(), 2U);
  EXPECT_EQ(list.runs[0].child, 7);
  EXPECT_EQ(list.runs[0].childName, "Seven");
  EXPECT_EQ(list.runs[1].child, -1);
  EXPECT_EQ(list.runs[1].workers.worker, "/32/worker");
  ASSERT_EQ(list.notRun.size(), 1U);
  EXPECT_EQ(list.notRun[0].run.child, 3);
  EXPECT_EQ(list.notRun[0].reason, "slow");
}

}  // namespace
