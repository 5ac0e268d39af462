// SPDX-License-Identifier: MIT
// The bare host that benchmarks compare the program with holds the same conversation: a plug-in that writes
// down everything its host does writes the same lines for both.
#include <filesystem>
#include <fstream>
#include <sstream>

#include <gmock/gmock.h>

#include "tests/shared/program_run.h"
#include "tests/shared/temporary_directory.h"

using testing::Contains;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

std::string contentOf(const std::filesystem::path& path) {
  std::ifstream file(path);
  std::ostringstream content;
  content << file.rdbuf();
  return content.str();
}

struct Recording {
  std::string conversation;
  ProgramRun run;
};

class FloorConversation : public testing::Test {
 protected:
  Recording recordProgram() { return record(runTool, {samplePlugin("records_requests")}); }

  /// The bare host, with the random tests that the program drew in `run`.
  Recording recordFloor(const ProgramRun& run) {
    return record(runBareHost, {keepLines(run), samplePlugin("records_requests")});
  }

  std::string keepLines(const ProgramRun& run) {
    const std::filesystem::path path = folder.path() / "lines";
    std::ofstream(path) << run.standardOutput;
    return path.string();
  }

  static ProgramRun runTool(const ProgramCall& call) { return runVstTorture(call); }
  static ProgramRun runBareHost(const ProgramCall& call) { return runProgram(BARE_HOST, call); }

  std::map<std::string, std::string> environment;

 private:
  Recording record(ProgramRun (*program)(const ProgramCall&), const std::vector<std::string>& arguments) {
    const std::filesystem::path log = folder.path() / ("log" + std::to_string(++recordings));
    ProgramCall call;
    call.arguments = arguments;
    call.environment = environment;
    call.environment["RECORDS_REQUESTS_LOG"] = log.string();
    ProgramRun run = program(call);
    return {contentOf(log), run};
  }

  TemporaryDirectory folder;
  int recordings = 0;
};

/// One request that only the state in question leads to, so that an empty recording proves nothing.
void expectSameConversation(const Recording& program, const Recording& bareHost, const std::string& mark) {
  EXPECT_EQ(program.run.end, "exit status 0");
  EXPECT_EQ(bareHost.run.end, "exit status 0");
  EXPECT_EQ(bareHost.run.standardError, "");
  EXPECT_EQ(lines(bareHost.run.standardOutput), lines(program.run.standardOutput));
  EXPECT_THAT(lines(program.conversation), Contains(HasSubstr(mark)));
  EXPECT_EQ(lines(bareHost.conversation), lines(program.conversation));
}

TEST_F(FloorConversation, IsTheProgramsWhereTheStateIsParameterValues) {
  const Recording program = recordProgram();
  expectSameConversation(program, recordFloor(program.run), "1 dispatch 2 index 0 value 2 ");
}

TEST_F(FloorConversation, IsTheProgramsWhereTheStateIsAChunk) {
  environment["RECORDS_REQUESTS_CHUNKS"] = "1";
  const Recording program = recordProgram();
  expectSameConversation(program, recordFloor(program.run), "2 dispatch 24 index 0 value 40 ");
}

TEST_F(FloorConversation, IsTheProgramsWhereProgramsHaveNoNameByIndex) {
  environment["RECORDS_REQUESTS_CHUNKS"] = "1";
  environment["RECORDS_REQUESTS_UNNAMED_PROGRAMS"] = "1";
  const Recording program = recordProgram();
  expectSameConversation(program, recordFloor(program.run), "2 dispatch 2 index 0 value 1 ");
}

TEST_F(FloorConversation, OfAShellEndsAfterItsDescription) {
  const ProgramRun program = runVstTorture({samplePlugin("shell")});
  const ProgramRun bareHost = runBareHost({{keepLines(program), samplePlugin("shell")}});
  EXPECT_EQ(bareHost.end, "exit status 1");
  EXPECT_EQ(bareHost.standardOutput, "total, 51\n1, test gathering info\n");
  EXPECT_EQ(bareHost.standardOutput, program.standardOutput);
}

TEST_F(FloorConversation, OfAShellsChildIsAFullRun) {
  const ProgramRun program = runVstTorture({samplePlugin("shell"), "1234"});
  const ProgramRun bareHost = runBareHost({{keepLines(program), samplePlugin("shell"), "1234"}});
  EXPECT_EQ(bareHost.end, "exit status 0");
  EXPECT_THAT(bareHost.standardOutput, StartsWith("total, 64\n"));
  EXPECT_EQ(bareHost.standardOutput, program.standardOutput);
}

TEST_F(FloorConversation, IsRefusedWithoutTheLinesOfARunThatPassed) {
  ProgramRun cut;
  cut.standardOutput = "total, 64\n1, test gathering info\n16, inspect latency\n";
  const ProgramRun bareHost = runBareHost({{keepLines(cut), samplePlugin("well_behaved_effect")}});
  EXPECT_EQ(bareHost.end, "exit status 2");
  EXPECT_THAT(bareHost.standardError, HasSubstr("is not the output of a run that passed"));
  EXPECT_EQ(bareHost.standardOutput, "");
}

}  // namespace
