// SPDX-License-Identifier: MIT
// runProgram() reports and ends shell scripts as a host would. What it gets wrong, every end-to-end test gets
// wrong.
#include <csignal>
#include <filesystem>
#include <fstream>
#include <system_error>

#include <gmock/gmock.h>
#include <unistd.h>

#include "tests/shared/program_run.h"

using testing::ElementsAre;
using testing::Ge;
using testing::Lt;
using testing::StartsWith;

namespace {

ProgramRun runScript(const std::string& script, ProgramCall call = {}) {
  call.arguments = {"-c", script};
  return runProgram("/bin/sh", call);
}

ProgramCall endAfter(double seconds) {
  ProgramCall call;
  call.timeLimitInSeconds = seconds;
  return call;
}

ProgramCall readBy(Reader reader, double timeLimitInSeconds = 60) {
  ProgramCall call = endAfter(timeLimitInSeconds);
  call.reader = reader;
  return call;
}

ProgramCall interruptedBy(const std::vector<int>& signals, const std::string& afterText) {
  ProgramCall call;
  call.interruption.signals = signals;
  call.interruption.afterText = afterText;
  return call;
}

/// Whether the process whose number a script printed ends within five seconds: a kill takes a moment. A
/// process whose parent has not taken its status counts as ended.
bool isGone(const std::string& processId) {
  const std::string path = "/proc/" + std::to_string(std::stoi(processId)) + "/stat";
  for (int i = 0; i < 500; ++i) {
    std::string number, name, state;
    if (!(std::ifstream(path) >> number >> name >> state) || state == "Z") return true;
    usleep(10000);
  }
  return false;
}

TEST(RunProgram, ReturnsBothStreamsAndTheExitStatus) {
  const ProgramRun run = runScript("echo out; echo err >&2; printf last; exit 3");
  EXPECT_EQ(run.standardOutput, "out\nlast");
  EXPECT_EQ(run.standardError, "err\n");
  EXPECT_EQ(run.end, "exit status 3");
  EXPECT_EQ(runScript("kill -SEGV $$").end, "signal 11");
}

TEST(RunProgram, ReadsAMegabyteFromBothStreamsAtOnce) {
  const ProgramRun run = runScript(
      "head -c 1048576 /dev/zero | tr '\\0' e >&2 & head -c 1048576 /dev/zero | tr '\\0' o; wait; exit 4");
  EXPECT_EQ(run.standardOutput, std::string(1048576, 'o'));
  EXPECT_EQ(run.standardError, std::string(1048576, 'e'));
  EXPECT_EQ(run.end, "exit status 4");
}

TEST(RunProgram, KillsAtTheLimitWithEverythingThatTheProgramStarted) {
  // Long enough for the script to print even where the machine is busy.
  const ProgramRun run = runScript("sleep 30 & echo $!; while :; do sleep 30; done", endAfter(2));
  EXPECT_EQ(run.end, "timed out");
  EXPECT_TRUE(isGone(run.standardOutput));
  EXPECT_EQ(runScript("while :; do echo again; done", endAfter(0.2)).end, "timed out");
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

TEST(RunProgram, GivesTheProgramTheSameStartEverywhere) {
  setenv("VSTTORTURE_TEST_VARIABLE", "1", 1);
  setenv("LC_ALL", "de_DE.UTF-8", 1);
  std::signal(SIGPIPE, SIG_IGN);
  ProgramCall call;
  call.environment = {{"EXTRA", "a value"}};
  const ProgramRun run = runScript(
      "cat; ulimit -c; ulimit -s; ps -o pgid= -p $$ | grep -q $$ && echo leads its group; ls /proc/$$/fd;"
      " echo $LC_ALL; echo \"$EXTRA\"; echo \"[$VSTTORTURE_TEST_VARIABLE]\"; grep SigIgn /proc/$$/status;"
      " test \"$HOME\" -ef . && touch file && echo \"$HOME\"",
      call);
  std::signal(SIGPIPE, SIG_DFL);
  unsetenv("VSTTORTURE_TEST_VARIABLE");
  unsetenv("LC_ALL");
  std::vector<std::string> printed = lines(run.standardOutput);
  const std::string home = printed.back();
  printed.pop_back();
  EXPECT_THAT(printed, ElementsAre("0", "8192", "leads its group", "0", "1", "2", "C", "a value", "[]",
                                   "SigIgn:\t0000000000000000"));
  EXPECT_THAT(home, StartsWith("/"));
  EXPECT_FALSE(std::filesystem::exists(home));
}

TEST(RunProgram, ThrowsWhenTheProgramCannotBeStarted) {
  EXPECT_THROW(runProgram("/no/such/program", {}), std::system_error);
  ProgramCall call;
  call.workingDirectory = "/no/such/folder";
  EXPECT_THROW(runScript("exit 0", call), std::system_error);
}

TEST(Interruption, SendsItsSignalsAfterTheText) {
  ProgramCall call = interruptedBy({SIGUSR1, SIGTERM}, "ready");
  call.interruption.secondsBetween = 0.2;
  const ProgramRun run = runScript(
      "trap 'echo one' USR1; trap 'echo two; exit 4' TERM; sleep 0.1; echo ready;"
      " while :; do sleep 0.01; done",
      call);
  EXPECT_EQ(run.standardOutput, "ready\none\ntwo\n");
  EXPECT_EQ(run.end, "exit status 4");
  EXPECT_THAT(run.secondsSinceInterruption, Lt(run.elapsedSeconds));
}

TEST(Interruption, WaitsForTheTime) {
  ProgramCall call = interruptedBy({SIGKILL}, "");
  call.interruption.afterSeconds = 0.2;
  const ProgramRun run = runScript("exec sleep 30", call);
  EXPECT_EQ(run.end, "signal 9");
  EXPECT_THAT(run.elapsedSeconds, Ge(0.2));
}

TEST(ReaderOfTheOutput, LosesNothingWhenItReadsLate) {
  const ProgramRun quick = runScript("echo text; exit 2", readBy(Reader::kReadsLate));
  EXPECT_EQ(quick.standardOutput, "text\n");
  const ProgramRun run = runScript("head -c 1048576 /dev/zero; echo end", readBy(Reader::kReadsLate));
  EXPECT_EQ(run.standardOutput, std::string(1048576, '\0') + "end\n");
  EXPECT_THAT(run.elapsedSeconds, Ge(0.5));
}

TEST(ReaderOfTheOutput, BlocksTheFirstByteWhenItNeverReads) {
  const ProgramRun run = runScript("echo text; echo more >&2", readBy(Reader::kNeverReads, 0.3));
  EXPECT_EQ(run.end, "timed out");
  EXPECT_EQ(run.standardOutput + run.standardError, "");
}

TEST(ReaderOfTheOutput, BlocksAProgramThatPrintsOnWhenItStops) {
  ProgramCall call = readBy(Reader::kStops, 2);
  call.interruption.afterText = "stop";
  const ProgramRun run = runScript("echo first; echo stop; exec cat /dev/zero", call);
  EXPECT_EQ(run.end, "timed out");
  EXPECT_THAT(run.standardOutput, StartsWith("first\nstop\n"));
  EXPECT_THAT(run.standardOutput.size(), Lt(300000u));
}

TEST(ReaderOfTheOutput, CanBeGoneOrMissing) {
  EXPECT_EQ(runScript("exec cat /dev/zero", readBy(Reader::kIsGone)).end, "signal 13");
  EXPECT_EQ(runScript("test -e /proc/self/fd/1 && exit 1; exit 7", readBy(Reader::kWasNone)).end,
            "exit status 7");
}

TEST(Lines, AreTheTextBetweenLineEnds) {
  EXPECT_THAT(lines("one\n\nunexpected exit"), ElementsAre("one", "", "unexpected exit"));
  EXPECT_THAT(lines("one\n"), ElementsAre("one"));
}

}  // namespace
