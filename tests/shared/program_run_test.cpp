// SPDX-License-Identifier: MIT
// The harness itself, tried on shell scripts that end in every way.
#include <cerrno>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <system_error>

#include <gmock/gmock.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/shared/program_run.h"
#include "tests/shared/temporary_directory.h"

using testing::ElementsAre;
using testing::Ge;
using testing::IsEmpty;
using testing::Lt;

namespace {

ProgramRun runScript(const std::string& script, ProgramCall call = {}) {
  call.arguments = {"-c", script};
  return runProgram("/bin/sh", call);
}

/// Whether the process whose number a script wrote down is gone, or dead and not yet reaped by whoever
/// inherited it. A moment is allowed: a kill is not waited for.
bool isGone(const std::string& processId) {
  const std::string path = "/proc/" + std::to_string(std::stoi(processId)) + "/stat";
  for (int i = 0; i < 500; ++i) {
    std::string number, name, state;
    if (!(std::ifstream(path) >> number >> name >> state) || state == "Z") return true;
    usleep(10000);
  }
  return false;
}

std::size_t openDescriptors() {
  std::size_t count = 0;
  for ([[maybe_unused]] const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) ++count;
  return count;
}

TEST(RunProgram, TellsTheExitStatus) {
  const ProgramRun run = runScript("exit 3");
  EXPECT_EQ(run.end, "exit status 3");
  EXPECT_EQ(run.standardOutput, "");
  EXPECT_EQ(run.standardError, "");
}

TEST(RunProgram, TellsTheSignalThatKilled) {
  EXPECT_EQ(runScript("kill -9 $$").end, "signal 9");
  EXPECT_EQ(runScript("kill -SEGV $$").end, "signal 11");
}

TEST(RunProgram, ReadsBothStreamsSeparately) {
  const ProgramRun run = runScript("echo out; echo err >&2; printf last");
  EXPECT_EQ(run.standardOutput, "out\nlast");
  EXPECT_EQ(run.standardError, "err\n");
}

TEST(RunProgram, ReadsAMegabyteFromBothStreamsAtOnce) {
  const ProgramRun run = runScript(
      "head -c 1048576 /dev/zero | tr '\\0' e >&2 & head -c 1048576 /dev/zero | tr '\\0' o; wait; exit 4");
  EXPECT_EQ(run.standardOutput, std::string(1048576, 'o'));
  EXPECT_EQ(run.standardError, std::string(1048576, 'e'));
  EXPECT_EQ(run.end, "exit status 4");
}

TEST(RunProgram, KillsAProgramThatHangs) {
  ProgramCall call;
  call.timeLimitInSeconds = 0.3;
  const ProgramRun run = runScript("echo $$; while :; do sleep 30; done", call);
  EXPECT_EQ(run.end, "timed out");
  EXPECT_THAT(run.elapsedSeconds, Ge(0.3));
  EXPECT_THAT(run.elapsedSeconds, Lt(10));
  EXPECT_TRUE(isGone(run.standardOutput));
}

TEST(RunProgram, KillsAProgramThatNeverStopsWriting) {
  ProgramCall call;
  call.timeLimitInSeconds = 0.2;
  const ProgramRun run = runScript("while :; do echo again; done", call);
  EXPECT_EQ(run.end, "timed out");
  EXPECT_THAT(run.elapsedSeconds, Lt(10));
}

TEST(RunProgram, KillsWhatAKilledProgramLeaves) {
  ProgramCall call;
  call.timeLimitInSeconds = 0.3;
  const ProgramRun run = runScript("sleep 30 & echo $!; wait", call);
  EXPECT_EQ(run.end, "timed out");
  EXPECT_TRUE(isGone(run.standardOutput));
}

TEST(RunProgram, DoesNotWaitForAGrandchildThatKeepsTheStreamsOpen) {
  const ProgramRun run = runScript("sleep 30 & echo $!; exit 5");
  EXPECT_EQ(run.end, "exit status 5");
  EXPECT_THAT(run.elapsedSeconds, Lt(10));
  EXPECT_TRUE(isGone(run.standardOutput));
}

TEST(RunProgram, WaitsForAProgramThatClosesItsStreams) {
  EXPECT_EQ(runScript("exec >&- 2>&-; sleep 0.2; exit 6").end, "exit status 6");
}

TEST(RunProgram, GivesNothingToRead) { EXPECT_EQ(runScript("cat; echo end").standardOutput, "end\n"); }

TEST(RunProgram, DumpsNoCore) { EXPECT_EQ(runScript("ulimit -c").standardOutput, "0\n"); }

TEST(RunProgram, MakesTheProgramTheLeaderOfItsGroup) {
  const ProgramRun run = runScript("echo $$; ps -o pgid= -p $$ | tr -d ' '");
  ASSERT_EQ(lines(run.standardOutput).size(), 2u);
  EXPECT_EQ(lines(run.standardOutput)[0], lines(run.standardOutput)[1]);
}

TEST(RunProgram, PassesThreeDescriptorsAndNoMore) {
  EXPECT_EQ(runScript("ls /proc/$$/fd; :").standardOutput, "0\n1\n2\n");
}

TEST(RunProgram, FixesTheEnvironment) {
  setenv("VSTTORTURE_TEST_VARIABLE", "1", 1);
  setenv("LC_ALL", "de_DE.UTF-8", 1);
  ProgramCall call;
  call.environment = {{"EXTRA", "a value"}};
  const ProgramRun run = runScript(
      "echo $LC_ALL; echo \"$EXTRA\"; echo \"[$VSTTORTURE_TEST_VARIABLE]\"; test -d $HOME && echo home",
      call);
  EXPECT_THAT(lines(run.standardOutput), ElementsAre("C", "a value", "[]", "home"));
  unsetenv("VSTTORTURE_TEST_VARIABLE");
  unsetenv("LC_ALL");
}

TEST(RunProgram, PrefersTheCallersEnvironment) {
  ProgramCall call;
  call.environment = {{"LC_ALL", "ja_JP"}};
  EXPECT_EQ(runScript("echo $LC_ALL", call).standardOutput, "ja_JP\n");
}

TEST(RunProgram, GivesAHomeThatGoesWithTheRun) {
  const ProgramRun run = runScript("touch $HOME/file; echo $HOME; pwd");
  ASSERT_EQ(lines(run.standardOutput).size(), 2u);
  const std::string home = lines(run.standardOutput)[0];
  EXPECT_EQ(lines(run.standardOutput)[1], home);
  EXPECT_FALSE(std::filesystem::exists(home));
}

TEST(RunProgram, StartsInTheFolderAskedFor) {
  ProgramCall call;
  call.workingDirectory = "/usr/bin";
  EXPECT_EQ(runScript("pwd", call).standardOutput, "/usr/bin\n");
}

TEST(RunProgram, ThrowsWhenTheProgramCannotBeStarted) {
  EXPECT_THROW(runProgram("/no/such/program", {}), std::system_error);
  ProgramCall call;
  call.workingDirectory = "/no/such/folder";
  EXPECT_THROW(runScript("exit 0", call), std::system_error);
}

TEST(RunProgram, LeavesNoDescriptorAndNoChildBehind) {
  const std::size_t before = openDescriptors();
  ProgramCall call;
  call.timeLimitInSeconds = 0.1;
  runScript("sleep 30", call);
  runScript("exit 1");
  EXPECT_THROW(runProgram("/no/such/program", {}), std::system_error);
  EXPECT_EQ(openDescriptors(), before);
  EXPECT_EQ(waitpid(-1, nullptr, WNOHANG), -1);
  EXPECT_EQ(errno, ECHILD);
}

TEST(Lines, AreTheTextBetweenLineEnds) {
  EXPECT_THAT(lines(""), IsEmpty());
  EXPECT_THAT(lines("one\ntwo\n"), ElementsAre("one", "two"));
  EXPECT_THAT(lines("one\n\nunexpected exit"), ElementsAre("one", "", "unexpected exit"));
}

TEST(TemporaryDirectoryTest, GoesWithEverythingInIt) {
  std::filesystem::path path;
  {
    const TemporaryDirectory folder;
    path = folder.path();
    EXPECT_TRUE(path.is_absolute());
    std::filesystem::create_directories(path / "inner/most");
    std::ofstream(path / "inner/file") << "text";
    EXPECT_NE(TemporaryDirectory().path(), path);
  }
  EXPECT_FALSE(std::filesystem::exists(path));
}

}  // namespace
