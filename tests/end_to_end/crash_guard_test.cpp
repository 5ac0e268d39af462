// SPDX-License-Identifier: MIT
// Every end of a process is a known end: crashes and exits of a plug-in, seen through pipes.
#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/program_run.h"
#include "tests/shared/protocol_lines.h"
#include "tests/shared/sanitizer.h"

using testing::HasSubstr;
using testing::Lt;
using testing::Not;
using testing::SizeIs;
using testing::StartsWith;

namespace {

ProgramCall faulty(const std::string& kind, const std::string& place) {
  ProgramCall call;
  call.arguments = {samplePlugin("faulty")};
  call.environment = {{"FAULT_KIND", kind}, {"FAULT_PLACE", place}};
  return call;
}

/// A crash in step 6, "inspect latency".
struct Crash {
  std::string name;
  std::string kind;
  std::string end = "exit status 7";
  std::string standardError = {};
  NotWith notWith = {};
};

const NotWith kOtherHeap = {"the sanitizer's heap has no such lock", "the sanitizer's heap has no such lock"};

const NotWith kTimerHeldBack = {
    "", "the sanitizer keeps the timer's signal back while exit() waits for the lock"};

const Crash kCrashes[] = {
    {"NullStore", "null_store"},
    {"ReadOnlyMemory", "write_read_only"},
    {"StackOverflow", "stack_overflow"},
    {"Abort", "abort"},
    {"Terminate", "terminate", "exit status 7", "terminate called without an active exception\n"},
    {"Exit", "exit", "exit status 0"},
    {"DivisionByZero", "divide_by_zero", "exit status 7",
     "vsttorture: uncaught system exception: arithmetic error (SIGFPE)\n"},
    {"IllegalInstruction", "illegal_instruction", "exit status 7",
     "vsttorture: uncaught system exception: illegal instruction (SIGILL)\n"},
    {"Trap", "raise:SIGTRAP", "exit status 7", "vsttorture: uncaught system exception: trap (SIGTRAP)\n"},
    {"BadSystemCall", "raise:SIGSYS", "exit status 7",
     "vsttorture: uncaught system exception: bad system call (SIGSYS)\n"},
    {"BusError", "raise:SIGBUS"},
    {"OnItsOwnThread", "thread_crash"},
    {"ThrowOnItsOwnThread", "thread_throw", "exit status 7",
     "terminate called after throwing an instance of 'int'\n"},
    {"InsideTheHeapsLock", "crash_with_heap_lock", "exit status 7",
     "malloc(): unsorted double linked list corrupted\n", kOtherHeap},
    {"StdoutLockedByAnotherThread", "crash_with_stdout_lock", "exit status 7", "", kTimerHeldBack},
    {"StdoutLockedByItself", "crash_with_own_stdout_lock"},
    {"UnderALockThatADestructorTakes", "crash_under_destructor_lock", "exit status 7", "", kTimerHeldBack},
    {"AndAgainInAnExitHandler", "crash_in_atexit+null_store"},
    {"AndAgainInADestructor", "crash_in_static_destructor+null_store"},
    {"AbortAndAgainInAnExitHandler", "crash_in_atexit+abort"},
    {"ExitAndThenInAnExitHandler", "crash_in_atexit+exit"},
};

class CrashInATest : public testing::TestWithParam<Crash> {};

TEST_P(CrashInATest, EndsWithTheLastWordsAndAKnownStatus) {
  const std::string reason = GetParam().notWith.reason();
  if (!reason.empty()) GTEST_SKIP() << reason;
  const ProgramRun run = runVstTorture(faulty(GetParam().kind, "dispatch:52"));
  EXPECT_EQ(run.standardOutput, beginningOfRun(6) + "unexpected exit");
  EXPECT_EQ(run.standardError, GetParam().standardError);
  EXPECT_EQ(run.end, GetParam().end);
  EXPECT_THAT(run.elapsedSeconds, Lt(kEndLimitInSeconds));
}

INSTANTIATE_TEST_SUITE_P(Kinds, CrashInATest, testing::ValuesIn(kCrashes),
                         [](const auto& instance) { return instance.param.name; });

TEST(ExitInATest, KeepsThePluginsStatus) {
  ProgramCall call = faulty("exit", "dispatch:52");
  call.environment["FAULT_STATUS"] = "42";
  EXPECT_EQ(runVstTorture(call).end, "exit status 42");
  EXPECT_EQ(runVstTorture({samplePlugin("exits_in_test")}).standardOutput,
            beginningOfRun(6) + "unexpected exit");
  EXPECT_EQ(runVstTorture({samplePlugin("exits_in_test")}).end, "exit status 42");
}

struct EarlyEnd {
  std::string name;
  std::string plugin;
  std::string end;
};

class PluginWithoutInstance : public testing::TestWithParam<EarlyEnd> {};

TEST_P(PluginWithoutInstance, EndsWithTheLastWordsAndNothingElse) {
  ProgramCall call;
  call.arguments = {samplePlugin(GetParam().plugin)};
  call.environment = kNoLeakCheck;  // On purpose: an instance that could not be opened is not closed.
  const ProgramRun run = runVstTorture(call);
  EXPECT_EQ(run.standardOutput, "unexpected exit");
  EXPECT_EQ(run.standardError, "");
  EXPECT_EQ(run.end, GetParam().end);
}

INSTANTIATE_TEST_SUITE_P(Samples, PluginWithoutInstance,
                         testing::Values(EarlyEnd{"NoEntry", "no_entry", "exit status 7"},
                                         EarlyEnd{"NullInstance", "null_instance", "exit status 7"},
                                         EarlyEnd{"EntryThrows", "entry_throws", "exit status 7"},
                                         EarlyEnd{"EntryThrowsInt", "entry_throws_int", "exit status 7"},
                                         EarlyEnd{"OpenThrows", "open_throws", "exit status 7"},
                                         EarlyEnd{"OpenThrowsInt", "open_throws_int", "exit status 7"},
                                         EarlyEnd{"OpenCrashes", "open_crashes", "exit status 7"},
                                         EarlyEnd{"ExitsOnOpen", "exits_on_open", "exit status 0"}),
                         [](const auto& instance) { return instance.param.name; });

// The second description is made without an instance; the first drawn test then has nothing to work on.
TEST(RecreationWithoutInstance, CrashesInTheFirstDrawnTest) {
  const ProgramRun run = runVstTorture(faulty("throw_int", "entry:2"));
  const std::vector<std::string> printed = lines(run.standardOutput);
  ASSERT_THAT(printed, SizeIs(18));
  EXPECT_THAT(run.standardOutput, StartsWith(beginningOfRun(15)));
  EXPECT_TRUE(isDrawnStep(printed[16], 16)) << printed[16];
  EXPECT_EQ(printed[17], "unexpected exit");
  EXPECT_EQ(run.end, "exit status 7");
}

class CrashAfterAPass : public testing::TestWithParam<const char*> {};

TEST_P(CrashAfterAPass, SpoilsTheStatusAndAddsNoLine) {
  const ProgramRun run = runVstTorture(faulty(GetParam(), "dispatch:52"));
  EXPECT_THAT(run.standardOutput, StartsWith(beginningOfRun(15)));
  EXPECT_THAT(lines(run.standardOutput), SizeIs(66));
  EXPECT_THAT(run.standardOutput, Not(HasSubstr("unexpected exit")));
  EXPECT_EQ(run.end, "exit status 7");
  EXPECT_THAT(run.elapsedSeconds, Lt(kEndLimitInSeconds));
}

INSTANTIATE_TEST_SUITE_P(Kinds, CrashAfterAPass,
                         testing::Values("crash_in_atexit", "crash_in_static_destructor"));

TEST(TextWithoutLineEnd, StandsBeforeTheLastWords) {
  for (const std::string crash : {"null_store", "abort", "exit", "illegal_instruction"}) {
    const ProgramRun run = runVstTorture(faulty("print+" + crash, "dispatch:52"));
    EXPECT_EQ(run.standardOutput, beginningOfRun(6) + "a text without an endunexpected exit") << crash;
  }
}

}  // namespace
