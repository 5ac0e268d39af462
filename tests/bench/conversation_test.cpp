// SPDX-License-Identifier: MIT
// The bare host, with which benchmarks compare the program, makes the same requests: the recording sample
// writes the same lines for both.
#include <filesystem>
#include <fstream>
#include <iterator>

#include <gmock/gmock.h>

#include "tests/shared/program_run.h"
#include "tests/shared/protocol.h"
#include "tests/shared/temporary_directory.h"

using testing::Contains;
using testing::HasSubstr;
using testing::SizeIs;

namespace {

class BareHost : public testing::Test {
 protected:
  /// Runs the program. The sample writes its requests to standard output, between the program's lines.
  ProgramRun runProgramUnderTest(const std::vector<std::string>& arguments) {
    return runVstTorture(callWith(arguments));
  }

  /// Runs the bare host with the random tests that were drawn in `run`.
  ProgramRun runBareHost(const ProgramRun& run, std::vector<std::string> arguments) {
    const std::filesystem::path path = folder.path() / "lines";
    std::ofstream stepLines(path);
    for (const Section& section : sections(run.standardOutput)) {
      if (!section.line.whole.empty()) stepLines << section.line.whole << '\n';
    }
    stepLines.close();
    arguments.insert(arguments.begin(), path.string());
    return runProgram(BARE_HOST, callWith(arguments));
  }

  /// Both make the same requests between the same lines. `request` is one that only this state of the sample
  /// leads to, so that two empty recordings do not pass.
  void expectSameConversation(const std::string& request) {
    const std::vector<std::string> sample = {samplePlugin("records_requests")};
    const ProgramRun program = runProgramUnderTest(sample);
    const ProgramRun bareHost = runBareHost(program, sample);
    EXPECT_EQ(program.end, "exit status 0");
    EXPECT_EQ(bareHost.end, "exit status 0");
    EXPECT_EQ(bareHost.standardError, "");
    EXPECT_THAT(lines(program.standardOutput), Contains(HasSubstr(request)));
    EXPECT_EQ(lines(bareHost.standardOutput), lines(program.standardOutput));
  }

  std::map<std::string, std::string> environment = {{"RECORDS_REQUESTS_LOG", "/dev/stdout"}};

 private:
  ProgramCall callWith(const std::vector<std::string>& arguments) const {
    ProgramCall call;
    call.arguments = arguments;
    call.environment = environment;
    return call;
  }

  TemporaryDirectory folder;
};

TEST_F(BareHost, MakesTheRequestsOfTheProgramWhereTheStateIsParameterValues) {
  expectSameConversation("1 dispatch 2 index 0 value 2 ");
}

TEST_F(BareHost, MakesTheRequestsOfTheProgramWhereTheStateIsAChunk) {
  environment["RECORDS_REQUESTS_CHUNKS"] = "1";
  expectSameConversation("2 dispatch 24 index 0 value 40 ");
}

TEST_F(BareHost, MakesTheRequestsOfTheProgramWhereProgramsHaveNoNameByIndex) {
  environment["RECORDS_REQUESTS_CHUNKS"] = "1";
  environment["RECORDS_REQUESTS_UNNAMED_PROGRAMS"] = "1";
  expectSameConversation("2 dispatch 2 index 0 value 1 ");
}

TEST_F(BareHost, EndsAfterTheDescriptionOfAShell) {
  const ProgramRun program = runProgramUnderTest({samplePlugin("shell")});
  const ProgramRun bareHost = runBareHost(program, {samplePlugin("shell")});
  EXPECT_EQ(bareHost.end, "exit status 1");
  EXPECT_EQ(bareHost.standardOutput, "total, 51\n1, test gathering info\n");
}

TEST_F(BareHost, RunsAllStepsForAChildOfAShell) {
  const ProgramRun program = runProgramUnderTest({samplePlugin("shell"), "1234"});
  const ProgramRun bareHost = runBareHost(program, {samplePlugin("shell"), "1234"});
  EXPECT_EQ(bareHost.end, "exit status 0");
  EXPECT_THAT(lines(bareHost.standardOutput), SizeIs(66));
  EXPECT_EQ(bareHost.standardOutput, program.standardOutput);
}

TEST_F(BareHost, RefusesTheLinesOfARunThatDidNotPass) {
  ProgramRun cut;
  cut.standardOutput = "total, 64\n1, test gathering info\n16, inspect latency\n";
  const ProgramRun bareHost = runBareHost(cut, {samplePlugin("well_behaved_effect")});
  EXPECT_EQ(bareHost.end, "exit status 2");
  EXPECT_THAT(bareHost.standardError, HasSubstr("is not the output of a run that passed"));
  EXPECT_EQ(bareHost.standardOutput, "");
}

}  // namespace
