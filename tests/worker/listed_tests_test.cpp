// SPDX-License-Identifier: MIT
// Tests of one's own choice: a failure of the random part can be had again.
#include <algorithm>
#include <fstream>
#include <map>

#include <gmock/gmock.h>

#include "tests/worker/worker_run.h"

using testing::ElementsAre;
using testing::HasSubstr;

namespace {

constexpr int kRunsToFindAFailure = 60;  // every second one fails

/// The tests that a run has begun, in their order, as --tests takes them.
std::string testsIn(const std::string& output) {
  static const std::map<std::string, char> kNumbers = {
      {"inspect class info", '0'},     {"inspect preset info", '1'}, {"inspect parameter info", '2'},
      {"testing setting states", '3'}, {"inspect latency", '4'},     {"inspect stream format", '5'}};
  std::string list;
  for (const std::string& line : lines(output)) {
    const auto number = kNumbers.find(line.substr(std::min(line.size(), line.find(", ") + 2)));
    if (number != kNumbers.end()) list += (list.empty() ? "" : ",") + std::string(1, number->second);
  }
  return list;
}

/// Without the numbers of the steps and what is not printed by tests.
std::string contentOf(const std::string& path) {
  std::ifstream file(path);
  return {std::istreambuf_iterator<char>(file), {}};
}

TEST(ListedTests, RunInTheirOrderBehindTheDescription) {
  const ProgramRun run = runWorker({"--tests", "5,0, 3 3", samplePlugin("well_behaved_effect")});
  EXPECT_THAT(lines(run.standardOutput),
              ElementsAre("total, 5", "1, test gathering info", "2, inspect stream format",
                          "3, inspect class info", "4, testing setting states", "5, testing setting states"));
  EXPECT_EQ(run.end, "exit status 0");
}

TEST(ListedTests, MayStandInAFile) {
  const TemporaryDirectory folder;
  const std::string path = (folder.path() / "tests").string();
  std::ofstream(path) << "4,\n1\n\n";
  const ProgramRun run = runWorker({"--tests=" + path, samplePlugin("well_behaved_effect")});
  EXPECT_THAT(lines(run.standardOutput), ElementsAre("total, 3", "1, test gathering info",
                                                     "2, inspect latency", "3, inspect preset info"));
}

TEST(ListedTests, AreNothingToAShell) {
  const ProgramRun run = runWorker({"--tests", "0,1", samplePlugin("shell")});
  EXPECT_THAT(lines(run.standardOutput), ElementsAre("total, 51", "1, test gathering info"));
  EXPECT_EQ(run.end, "exit status 1");
}

TEST(ListedTests, ReadOffAFailingRunFailInTheSameRequest) {
  const std::string plugin = samplePlugin("crashes_after_two_states");
  const RecordOnDisk record;
  ProgramRun failed;
  for (int i = 0; i < kRunsToFindAFailure; ++i) {
    failed = runWorker({"--record", record.path(), plugin});
    if (failed.end == "exit status 7") break;
  }
  ASSERT_EQ(failed.end, "exit status 7");
  const FlightReport first = record.report();
  // From the re-creation on: the crash is one of the second instance.
  const std::string drawn =
      testsIn(failed.standardOutput.substr(failed.standardOutput.find("14, initialize")));
  const ProgramRun again = runWorker({"--record", record.path(), "--tests", drawn, plugin});
  EXPECT_EQ(again.end, "exit status 7");
  EXPECT_EQ(testsIn(again.standardOutput), drawn);
  EXPECT_THAT(again.standardOutput, HasSubstr("unexpected exit"));
  const FlightReport second = record.report();
  EXPECT_EQ(second.request.state, kFlightUnderWay);
  EXPECT_EQ(textOf(first.request), "effGetTailSize (52)");
  EXPECT_EQ(textOf(second.request), textOf(first.request));
  EXPECT_EQ(placeOf(second.fault), placeOf(first.fault));
  EXPECT_EQ(second.stepText, first.stepText);
}

TEST(ListedTests, CanBeCutDownToTheShortestThatStillFails) {
  const std::string plugin = samplePlugin("crashes_after_two_states");
  EXPECT_EQ(runWorker({"--tests", "3,3,4", plugin}).end, "exit status 7");
  for (const char* shorter : {"3,3", "3,4", "3,4,3", "3,0,3,4"}) {
    EXPECT_EQ(runWorker({"--tests", shorter, plugin}).end, "exit status 0") << shorter;
  }
}

// On a plug-in that passes: the same list is the same conversation, to the last request.
TEST(ListedTests, MakeTheSameRequestsInEachRun) {
  const TemporaryDirectory folder;
  for (const char* log : {"first", "second"}) {
    ProgramCall call;
    call.arguments = {"--tests", "2,3,2,0,4", samplePlugin("excess_precision")};
    call.environment = {{"EXCESS_PRECISION_LOG", (folder.path() / log).string()}};
    ASSERT_EQ(runWorker(call).end, "exit status 0");
  }
  const std::string first = contentOf((folder.path() / "first").string());
  EXPECT_THAT(first, HasSubstr("getParameter 1\n"));
  EXPECT_EQ(contentOf((folder.path() / "second").string()), first);
}

}  // namespace
