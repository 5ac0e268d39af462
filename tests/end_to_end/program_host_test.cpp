// SPDX-License-Identifier: MIT
// The harness itself: hosts that interrupt a program, or do not read what it prints.
#include <csignal>

#include <gmock/gmock.h>

#include "tests/shared/program_run.h"

using testing::Ge;
using testing::Lt;
using testing::StartsWith;

namespace {

ProgramRun runScript(const std::string& script, ProgramCall call) {
  call.arguments = {"-c", script};
  return runProgram("/bin/sh", call);
}

ProgramCall readBy(Reader reader) {
  ProgramCall call;
  call.reader = reader;
  return call;
}

TEST(Interruption, WaitsForTheText) {
  ProgramCall call;
  call.interruption.signals = {SIGTERM};
  call.interruption.afterText = "ready";
  const ProgramRun run =
      runScript("trap 'echo caught; exit 4' TERM; sleep 0.1; echo ready; while :; do sleep 0.01; done", call);
  EXPECT_EQ(run.standardOutput, "ready\ncaught\n");
  EXPECT_EQ(run.end, "exit status 4");
  EXPECT_THAT(run.secondsSinceInterruption, Lt(run.elapsedSeconds));
}

TEST(Interruption, WaitsForTheTime) {
  ProgramCall call;
  call.interruption.signals = {SIGKILL};
  call.interruption.afterSeconds = 0.2;
  const ProgramRun run = runScript("exec sleep 30", call);
  EXPECT_EQ(run.end, "signal 9");
  EXPECT_THAT(run.elapsedSeconds, Ge(0.2));
}

TEST(Interruption, SendsSeveralSignals) {
  ProgramCall call;
  call.interruption.signals = {SIGUSR1, SIGTERM};
  call.interruption.afterText = "ready";
  call.interruption.secondsBetween = 0.2;
  const ProgramRun run = runScript(
      "trap 'echo one' USR1; trap 'echo two; exit' TERM; echo ready; while :; do sleep 0.01; done", call);
  EXPECT_EQ(run.standardOutput, "ready\none\ntwo\n");
}

TEST(Interruption, DoesNotComeWithoutItsText) {
  ProgramCall call;
  call.interruption.signals = {SIGKILL};
  call.interruption.afterText = "never";
  const ProgramRun run = runScript("echo text; sleep 0.1; exit 3", call);
  EXPECT_EQ(run.end, "exit status 3");
  EXPECT_EQ(run.secondsSinceInterruption, 0);
}

TEST(LateReading, LosesNothing) {
  const ProgramRun quick = runScript("echo text; exit 2", readBy(Reader::kReadsLate));
  EXPECT_EQ(quick.standardOutput, "text\n");
  EXPECT_THAT(quick.elapsedSeconds, Lt(0.5));
  const ProgramRun run = runScript("head -c 1048576 /dev/zero; echo end", readBy(Reader::kReadsLate));
  EXPECT_EQ(run.standardOutput, std::string(1048576, '\0') + "end\n");
  EXPECT_THAT(run.elapsedSeconds, Ge(0.5));
}

TEST(NoReading, BlocksTheFirstByte) {
  ProgramCall call = readBy(Reader::kNeverReads);
  call.timeLimitInSeconds = 0.3;
  const ProgramRun run = runScript("echo text; echo more >&2", call);
  EXPECT_EQ(run.end, "timed out");
  EXPECT_EQ(run.standardOutput, "");
  EXPECT_EQ(run.standardError, "");
}

TEST(StoppedReading, BlocksAProgramThatPrintsOn) {
  ProgramCall call = readBy(Reader::kStops);
  call.interruption.afterText = "stop";
  call.timeLimitInSeconds = 0.5;
  const ProgramRun run = runScript("echo first; echo stop; exec cat /dev/zero", call);
  EXPECT_EQ(run.end, "timed out");
  EXPECT_THAT(run.standardOutput, StartsWith("first\nstop\n"));
  EXPECT_THAT(run.standardOutput.size(), Lt(300000u));
}

TEST(GoneReader, GivesABrokenPipe) {
  EXPECT_EQ(runScript("exec cat /dev/zero", readBy(Reader::kIsGone)).end, "signal 13");
}

TEST(NoStandardOutput, IsClosed) {
  const ProgramRun run = runScript("test -e /proc/self/fd/1 && exit 1; exit 7", readBy(Reader::kWasNone));
  EXPECT_EQ(run.end, "exit status 7");
}

}  // namespace
