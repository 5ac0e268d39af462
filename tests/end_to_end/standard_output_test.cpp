// SPDX-License-Identifier: MIT
// Nothing that was printed is lost, and no state of standard output keeps the process alive.
#include <algorithm>
#include <csignal>
#include <future>
#include <map>
#include <string>

#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/protocol.h"
#include "tests/shared/sanitizer.h"

using testing::Lt;
using testing::StartsWith;

namespace {

ProgramCall faulty(const std::string& kind, const std::string& place, Reader reader) {
  ProgramCall call = faultyPlugin(kind, place);
  call.reader = reader;
  return call;
}

TEST(LateReader, GetsEveryLineOfACrash) {
  const ProgramRun run = runVstTorture(faulty("null_store", "dispatch:52", Reader::kReadsLate));
  EXPECT_EQ(run.standardOutput, beginningOfRun(6) + "unexpected exit");
  EXPECT_EQ(run.end, "exit status 7");
}

// The plug-in fills the pipe: the program waits until there is room, and goes on.
TEST(LateReader, GetsEveryLineThroughAPipeThatWasFull) {
  const ProgramRun run = runVstTorture(faulty("flood_stdout", "dispatch:52", Reader::kReadsLate));
  std::vector<std::string> actual = linesAndEnd(run);
  const auto rest = std::remove(actual.begin(), actual.end(), std::string(127, 'x'));
  EXPECT_EQ(actual.end() - rest, 65536);
  actual.erase(rest, actual.end());
  EXPECT_TRUE(matchesGolden("passing_run", actual));
}

TEST(HostThatStopsReading, DoesNotKeepACrashedProgramAlive) {
  std::map<std::string, std::future<ProgramRun>> runs;  // At the same time: each waits for a second.
  for (const char* kind : {"null_store", "abort", "raise:SIGTERM", "illegal_instruction"}) {
    runs[kind] = std::async(std::launch::async,
                            [=] { return runVstTorture(faulty(kind, "load", Reader::kNeverReads)); });
  }
  for (auto& [kind, pending] : runs) {
    const ProgramRun run = pending.get();
    EXPECT_EQ(run.standardOutput, "") << kind;
    EXPECT_EQ(run.end, "exit status 7") << kind;
    EXPECT_THAT(run.elapsedSeconds, Lt(kEndLimitInSeconds)) << kind;
  }
}

TEST(HostThatStopsReading, CanEndAProgramThatWaitsForRoomInThePipe) {
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

// Nobody reads the output: SIGPIPE ends the program at its first line.
TEST(HostThatHasExited, EndsTheProgram) {
  ProgramCall call;
  call.arguments = {samplePlugin("well_behaved_effect")};
  call.reader = Reader::kIsGone;
  EXPECT_EQ(runVstTorture(call).end, "signal 13");
}

}  // namespace
