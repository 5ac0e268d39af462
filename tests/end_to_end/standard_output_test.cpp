// SPDX-License-Identifier: MIT
// Nothing that was printed is lost, and nothing that happens to standard output keeps the process alive.
#include <csignal>

#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/program_run.h"
#include "tests/shared/protocol_lines.h"

using testing::Lt;
using testing::StartsWith;

namespace {

ProgramCall faulty(const std::string& kind, const std::string& place, Reader reader) {
  ProgramCall call;
  call.arguments = {samplePlugin("faulty")};
  call.environment = {{"FAULT_KIND", kind}, {"FAULT_PLACE", place}};
  call.reader = reader;
  return call;
}

TEST(LateReader, GetsEveryLineOfAPass) {
  ProgramCall call;
  call.arguments = {samplePlugin("well_behaved_effect")};
  call.reader = Reader::kReadsLate;
  const ProgramRun run = runVstTorture(call);
  std::vector<std::string> actual = lines(run.standardOutput);
  actual.push_back(run.end);
  EXPECT_TRUE(matchesGolden("well_behaved_effect", actual));
}

TEST(LateReader, GetsEveryLineOfACrash) {
  const ProgramRun run = runVstTorture(faulty("null_store", "dispatch:52", Reader::kReadsLate));
  EXPECT_EQ(run.standardOutput, beginningOfRun(6) + "unexpected exit");
  EXPECT_EQ(run.end, "exit status 7");
}

// The program has to wait for room in the pipe, and goes on when there is some.
TEST(LateReader, GetsEveryLineThroughAPipeThatWasFull) {
  const ProgramRun run = runVstTorture(faulty("flood_stdout", "dispatch:52", Reader::kReadsLate));
  std::vector<std::string> actual;
  std::size_t flooded = 0;
  for (const std::string& line : lines(run.standardOutput)) {
    if (line == std::string(127, 'x')) {
      ++flooded;
    } else {
      actual.push_back(line);
    }
  }
  actual.push_back(run.end);
  EXPECT_EQ(flooded, 65536u);
  EXPECT_TRUE(matchesGolden("well_behaved_effect", actual));
}

TEST(HostThatStopsReading, DoesNotKeepACrashedProgramAlive) {
  for (const char* kind : {"null_store", "abort", "raise:SIGTERM", "illegal_instruction"}) {
    const ProgramRun run = runVstTorture(faulty(kind, "load", Reader::kNeverReads));
    EXPECT_EQ(run.standardOutput, "") << kind;
    EXPECT_EQ(run.end, "exit status 7") << kind;
    EXPECT_THAT(run.elapsedSeconds, Lt(kEndLimitInSeconds)) << kind;
  }
}

TEST(HostThatStopsReading, CanEndAProgramThatWaitsForRoom) {
  ProgramCall call = faulty("flood_stdout", "dispatch:52", Reader::kStops);
  call.interruption.signals = {SIGTERM};
  call.interruption.afterText = "6, inspect latency\n";
  call.interruption.afterSeconds = 0.3;
  const ProgramRun run = runVstTorture(call);
  EXPECT_THAT(run.standardOutput, StartsWith(beginningOfRun(6)));
  EXPECT_EQ(run.end, "exit status 7");
  EXPECT_THAT(run.secondsSinceInterruption, Lt(kEndLimitInSeconds));
}

TEST(ClosedStandardOutput, ChangesNoStatus) {
  EXPECT_EQ(runVstTorture(faulty("null_store", "dispatch:52", Reader::kWasNone)).end, "exit status 7");
  EXPECT_EQ(runVstTorture(faulty("exit", "dispatch:52", Reader::kWasNone)).end, "exit status 0");
  EXPECT_EQ(runVstTorture(faulty("throw_int", "dispatch:52", Reader::kWasNone)).end, "exit status 3");
  ProgramCall call;
  call.reader = Reader::kWasNone;
  EXPECT_EQ(runVstTorture(call).end, "exit status 2");
  call.arguments = {samplePlugin("shell")};
  EXPECT_EQ(runVstTorture(call).end, "exit status 1");
  call.arguments = {samplePlugin("well_behaved_effect")};
  EXPECT_EQ(runVstTorture(call).end, "exit status 0");
}

TEST(ClosedStandardOutput, ByThePluginLosesOnlyWhatFollows) {
  const ProgramRun run = runVstTorture(faulty("close_stdout", "dispatch:52", Reader::kReads));
  EXPECT_EQ(run.standardOutput, beginningOfRun(6));
  EXPECT_EQ(run.end, "exit status 0");
  const ProgramRun crash = runVstTorture(faulty("close_stdout+null_store", "dispatch:52", Reader::kReads));
  EXPECT_EQ(crash.standardOutput, beginningOfRun(6));
  EXPECT_EQ(crash.end, "exit status 7");
}

// Nobody is left to read a verdict: the system ends the program at its first line.
TEST(HostThatHasGone, EndsTheProgram) {
  ProgramCall call;
  call.arguments = {samplePlugin("well_behaved_effect")};
  call.reader = Reader::kIsGone;
  EXPECT_EQ(runVstTorture(call).end, "signal 13");
}

}  // namespace
