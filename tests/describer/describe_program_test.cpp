// SPDX-License-Identifier: MIT
// vsttorture-describe as a host runs it: statuses, and standard output with one whole object or nothing.
#include <string>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "tests/shared/program_run.h"

namespace {

using testing::AllOf;
using testing::EndsWith;
using testing::HasSubstr;
using testing::StartsWith;

ProgramRun describe(const ProgramCall& call) { return runProgram(DESCRIBE_PROGRAM, call); }
ProgramRun describe(const std::vector<std::string>& arguments) { return describe(ProgramCall{arguments}); }

TEST(Describe, PrintsOneObjectAndEndsWithZero) {
  const ProgramRun run = describe({samplePlugin("well_behaved_effect")});
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.standardOutput, AllOf(StartsWith("{\n"), EndsWith("\n}\n"), HasSubstr("\"Volume\"")));
  EXPECT_EQ(run.standardError, "");
}

TEST(Describe, OfAShellListsItsChildrenAndEndsWithOne) {
  const ProgramRun run = describe({samplePlugin("shell")});
  EXPECT_EQ(run.end, "exit status 1");
  EXPECT_THAT(run.standardOutput, HasSubstr("\"id\": 1234,\n      \"name\": \"Second child\""));
}

TEST(Describe, OfAChildOfAShellNamesTheChild) {
  const ProgramRun run = describe({samplePlugin("shell"), "1234"});
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.standardOutput, HasSubstr("\"childId\": 1234,\n  \"name\": \"Second child\""));
}

struct EndCase {
  const char* name;
  std::vector<std::string> arguments;
  const char* end;
  const char* standardError;
};

class DescribeEnd : public testing::TestWithParam<EndCase> {};

TEST_P(DescribeEnd, BeforeTheDescriptionIsWholeLeavesStandardOutputEmpty) {
  const ProgramRun run = describe(GetParam().arguments);
  EXPECT_EQ(run.end, GetParam().end);
  EXPECT_EQ(run.standardOutput, "");
  EXPECT_THAT(run.standardError, HasSubstr(GetParam().standardError));
}

INSTANTIATE_TEST_SUITE_P(
    Ends, DescribeEnd,
    testing::Values(
        EndCase{"NoBundleNamed", {}, "exit status 2", "usage: vsttorture-describe BUNDLE [CHILD_ID]"},
        EndCase{"NoSuchFile", {"/nowhere/a.so"}, "exit status 3", "!create and initialize failed -1"},
        EndCase{"Refused", {"/anywhere/grove.vst"}, "exit status 5", ""},
        EndCase{"NoInstance", {samplePlugin("null_instance")}, "exit status 7", "unexpected exit"},
        EndCase{"CrashWhileOpened", {samplePlugin("open_crashes")}, "exit status 7", "unexpected exit"},
        EndCase{"ExitWhileOpened", {samplePlugin("exits_on_open")}, "exit status 0", "unexpected exit"}),
    [](const auto& row) { return row.param.name; });

TEST(Describe, SendsWhatThePluginPrintsToStandardError) {
  ProgramCall call{{samplePlugin("faulty")}};
  call.environment = {{"FAULT_KIND", "print"}, {"FAULT_PLACE", "dispatch:35"}};
  const ProgramRun run = describe(call);
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.standardOutput, AllOf(StartsWith("{\n"), EndsWith("\n}\n")));
  EXPECT_NE(run.standardError, "");
}

TEST(Describe, SaysThatNobodyReadsItsOutput) {
  ProgramCall call{{samplePlugin("well_behaved_effect")}};
  call.reader = Reader::kIsGone;
  const ProgramRun run = describe(call);
  EXPECT_EQ(run.end, "exit status 74");
  EXPECT_THAT(run.standardError, HasSubstr("the description cannot be written: Broken pipe"));
}

}  // namespace
