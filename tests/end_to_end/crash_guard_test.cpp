// SPDX-License-Identifier: MIT
// What the fault matrix does not check about crashes: the time that a run takes to end, what is written to
// standard error, and that text without a line end is printed before "unexpected exit".
#include <algorithm>

#include <gmock/gmock.h>

#include "tests/shared/program_run.h"
#include "tests/shared/protocol.h"
#include "tests/shared/sanitizer.h"

using testing::Ge;
using testing::Lt;

namespace {

struct Crash {
  std::string name;
  std::string kind;
  std::string standardError = {};
  NotWith notWith = {};
};

const NotWith kNotWithAnotherHeap = {"the sanitizer's heap has no such lock",
                                     "the sanitizer's heap has no such lock"};
const NotWith kNotWhereSignalsWait = {
    "", "the sanitizer delays the timer's signal while exit() waits for the lock"};

const Crash kCrashes[] = {
    {"NullStore", "null_store"},
    {"ReadOnlyMemory", "write_read_only"},
    {"StackOverflow", "stack_overflow"},
    {"Abort", "abort"},
    {"BusError", "raise:SIGBUS"},
    {"OnAThreadOfThePlugin", "thread_crash"},
    {"WithTheHeapLocked", "crash_with_heap_lock", "malloc(): unsorted double linked list corrupted\n",
     kNotWithAnotherHeap},
    {"WithStdoutLockedByAnotherThread", "crash_with_stdout_lock", "", kNotWhereSignalsWait},
    {"WithStdoutLockedByItself", "crash_with_own_stdout_lock"},
    {"WithALockThatADestructorTakes", "crash_under_destructor_lock", "", kNotWhereSignalsWait},
    {"AndAgainInAnExitHandler", "crash_in_atexit+null_store"},
    {"AndAgainInADestructor", "crash_in_static_destructor+null_store"},
    {"AbortAndAgainInAnExitHandler", "crash_in_atexit+abort"},
    {"ExitAndThenInAnExitHandler", "crash_in_atexit+exit"},
    {"InAnExitHandlerAfterAPass", "crash_in_atexit"},
    {"InADestructorAfterAPass", "crash_in_static_destructor"},
};

class CrashOfAPlugin : public testing::TestWithParam<Crash> {};

TEST_P(CrashOfAPlugin, EndsTheRunSoonWithStatusSeven) {
  const std::string reason = GetParam().notWith.reason();
  if (!reason.empty()) GTEST_SKIP() << reason;
  const ProgramRun run = runVstTorture(faultyPlugin(GetParam().kind, "dispatch:52"));
  EXPECT_EQ(run.standardError, GetParam().standardError);
  EXPECT_EQ(run.end, "exit status 7");
  EXPECT_THAT(run.elapsedSeconds, Lt(kEndLimitInSeconds));
}

INSTANTIATE_TEST_SUITE_P(Kinds, CrashOfAPlugin, testing::ValuesIn(kCrashes),
                         [](const auto& instance) { return instance.param.name; });

// On a busy machine a run may be late, so the shortest of several counts.
TEST(ExitThatIsBlocked, IsEndedAfterASecond) {
  if (!kNotWhereSignalsWait.reason().empty()) GTEST_SKIP() << kNotWhereSignalsWait.reason();
  double shortest = kEndLimitInSeconds;
  for (int i = 0; i < 10 && shortest >= 2; ++i) {
    const ProgramRun run = runVstTorture(faultyPlugin("crash_under_destructor_lock", "dispatch:52"));
    EXPECT_THAT(run.elapsedSeconds, Ge(1));
    shortest = std::min(shortest, run.elapsedSeconds);
  }
  EXPECT_THAT(shortest, Lt(2));
}

TEST(TextWithoutLineEnd, IsPrintedBeforeUnexpectedExit) {
  for (const std::string crash : {"null_store", "abort", "exit", "illegal_instruction"}) {
    const ProgramRun run = runVstTorture(faultyPlugin("print+" + crash, "dispatch:52"));
    EXPECT_EQ(run.standardOutput, beginningOfRun(6) + "a text without an endunexpected exit") << crash;
  }
}

}  // namespace
