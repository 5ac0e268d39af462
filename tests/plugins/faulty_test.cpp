// SPDX-License-Identifier: MIT
// Each fault of the faulty sample ends or disturbs its process as its name says, at the place asked for.
#include <ostream>

#include <gmock/gmock.h>

#include "tests/shared/program_run.h"

using testing::AllOf;
using testing::ElementsAre;
using testing::EndsWith;
using testing::Ge;
using testing::HasSubstr;
using testing::Lt;
using testing::Not;
using testing::StartsWith;

namespace {

constexpr const char* kWholeRun =
    "loaded\nmade 1466058086\nopened\ntext of 19\ntext of 5\ntail of 0\ndivided\nin ";

ProgramRun driveFaulty(const std::string& kind, const std::string& place,
                       std::map<std::string, std::string> environment = {}) {
  ProgramCall call;
  call.arguments = {samplePlugin("faulty")};
  call.environment = std::move(environment);
  call.environment.insert({{"FAULT_KIND", kind}, {"FAULT_PLACE", place}});
  call.timeLimitInSeconds = 20;
  return runProgram(TINY_HOST, call);
}

struct Ending {
  std::string name;
  std::string kind;
  std::string end;
};

void PrintTo(const Ending& ending, std::ostream* stream) { *stream << ending.kind; }

class FaultThatEnds : public testing::TestWithParam<Ending> {};

TEST_P(FaultThatEnds, EndsTheProcessAtOnce) {
  const ProgramRun run = driveFaulty(GetParam().kind, "dispatch:52", {{"FAULT_STATUS", "23"}});
  EXPECT_EQ(run.end, GetParam().end) << run.standardError;
  EXPECT_THAT(run.standardOutput, StartsWith("loaded\nmade 1466058086\nopened\ntext of 19\ntext of 5\n"));
  EXPECT_THAT(run.standardOutput, Not(HasSubstr("tail of")));
}

INSTANTIATE_TEST_SUITE_P(
    Faulty, FaultThatEnds,
    testing::Values(
        Ending{"NullStore", "null_store", "signal 11"},
        Ending{"WriteReadOnly", "write_read_only", "signal 11"},
        Ending{"StackOverflow", "stack_overflow", "signal 11"}, Ending{"Abort", "abort", "signal 6"},
        Ending{"Terminate", "terminate", "signal 6"}, Ending{"ThrowInt", "throw_int", "exit status 9"},
        Ending{"ThrowRuntimeError", "throw_runtime_error", "exit status 9"},
        Ending{"ThrowStruct", "throw_struct", "exit status 9"}, Ending{"Exit", "exit", "exit status 23"},
        Ending{"ExitAtOnce", "_exit", "exit status 23"}, Ending{"QuickExit", "quick_exit", "exit status 23"},
        Ending{"RaiseHup", "raise:SIGHUP", "signal 1"}, Ending{"RaiseInt", "raise:SIGINT", "signal 2"},
        Ending{"RaiseTrap", "raise:SIGTRAP", "signal 5"}, Ending{"RaiseBus", "raise:SIGBUS", "signal 7"},
        Ending{"RaiseKill", "raise:SIGKILL", "signal 9"}, Ending{"RaiseTerm", "raise:SIGTERM", "signal 15"},
        Ending{"RaiseSys", "raise:SIGSYS", "signal 31"},
        Ending{"RaiseUnknown", "raise:SIGNOTHING", "exit status 125"},
        Ending{"DivideByZero", "divide_by_zero", "signal 8"},
        Ending{"IllegalInstruction", "illegal_instruction", "signal 4"},
        Ending{"DoubleFree", "double_free", "signal 6"},
        Ending{"HeapCorruption", "heap_corruption", "signal 6"},
        Ending{"HeapLock", "crash_with_heap_lock", "signal 6"},
        Ending{"StdoutLock", "crash_with_stdout_lock", "signal 11"},
        Ending{"OwnStdoutLock", "crash_with_own_stdout_lock", "signal 11"},
        Ending{"DestructorLock", "crash_under_destructor_lock", "signal 11"},
        Ending{"ThreadCrash", "thread_crash", "signal 11"},
        Ending{"ThreadStackOverflow", "thread_stack_overflow", "signal 11"},
        Ending{"OtherProgram", "exec", "exit status 9"}, Ending{"ThreadThrow", "thread_throw", "signal 6"},
        Ending{"ReplacedHandlers", "replace_handlers_then_crash", "signal 11"},
        Ending{"BlockedSignals", "block_signals_then_crash", "signal 11"},
        Ending{"Unknown", "no_such_fault", "exit status 125"}),
    [](const auto& instance) { return instance.param.name; });

TEST(Faulty, BehavesWellWithoutAPlace) {
  ProgramCall call;
  call.arguments = {samplePlugin("faulty")};
  const ProgramRun run = runProgram(TINY_HOST, call);
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.standardOutput, AllOf(StartsWith(kWholeRun), EndsWith("closed\n")));
}

TEST(Faulty, ThrowsWhatItsKindSays) {
  EXPECT_THAT(driveFaulty("throw_int", "entry").standardOutput, EndsWith("caught int 5\n"));
  EXPECT_THAT(driveFaulty("throw_runtime_error", "entry").standardOutput,
              EndsWith("caught exception a fault on purpose\n"));
  EXPECT_THAT(driveFaulty("throw_struct", "entry").standardOutput, EndsWith("caught something\n"));
}

struct PlaceReached {
  std::string name;
  std::string place;
  std::string lastLine;
  std::string end;
};

class FaultPlace : public testing::TestWithParam<PlaceReached> {};

TEST_P(FaultPlace, IsWhereItHappens) {
  const ProgramRun run = driveFaulty("_exit", GetParam().place, {{"FAULT_STATUS", "23"}});
  EXPECT_EQ(run.end, GetParam().end);
  const std::vector<std::string> output = lines(run.standardOutput);
  EXPECT_EQ(output.empty() ? "" : output.back(), GetParam().lastLine);
}

INSTANTIATE_TEST_SUITE_P(
    Faulty, FaultPlace,
    testing::Values(PlaceReached{"Load", "load", "", "exit status 23"},
                    PlaceReached{"Entry", "entry", "loaded", "exit status 23"},
                    PlaceReached{"Open", "dispatch:0", "made 1466058086", "exit status 23"},
                    PlaceReached{"Request", "dispatch:7", "text of 19", "exit status 23"},
                    PlaceReached{"GetParameter", "getParameter", "text of 5", "exit status 23"},
                    PlaceReached{"SetParameter", "setParameter:2", "text of 5", "exit status 23"},
                    PlaceReached{"SetParameterOnce", "setParameter:3", "closed", "exit status 0"},
                    PlaceReached{"SecondRequest", "dispatch:0:2", "closed", "exit status 0"},
                    PlaceReached{"UnknownPlace", "elsewhere", "", "exit status 125"},
                    PlaceReached{"NoOpcode", "dispatch", "", "exit status 125"},
                    PlaceReached{"NoNumber", "dispatch:open", "", "exit status 125"},
                    PlaceReached{"TurnZero", "entry:0", "", "exit status 125"},
                    PlaceReached{"Trailing", "getParameter:1x", "", "exit status 125"}),
    [](const auto& instance) { return instance.param.name; });

TEST(FaultLock, OfTheHeapIsHeldByTheCrash) {
  const ProgramRun held = driveFaulty("crash_with_heap_lock", "dispatch:52",
                                      {{"TINY_HOST_ON_CRASH", "malloc"}, {"TINY_HOST_SECONDS", "1"}});
  EXPECT_EQ(held.end, "signal 14");
  EXPECT_THAT(held.standardOutput, EndsWith("crashed\n"));
}

TEST(FaultLock, OfStdoutIsHeldByAnotherThread) {
  const ProgramRun held = driveFaulty("crash_with_stdout_lock", "dispatch:52",
                                      {{"TINY_HOST_ON_CRASH", "stdout"}, {"TINY_HOST_SECONDS", "1"}});
  EXPECT_EQ(held.end, "signal 14");
  EXPECT_THAT(held.standardOutput, EndsWith("crashed\n"));
  EXPECT_EQ(driveFaulty("crash_with_own_stdout_lock", "dispatch:52", {{"TINY_HOST_ON_CRASH", "stdout"}}).end,
            "exit status 8");
}

TEST(FaultLock, OfADestructorIsHeldByTheCrash) {
  const ProgramRun held = driveFaulty("crash_under_destructor_lock", "dispatch:52",
                                      {{"TINY_HOST_ON_CRASH", "exit"}, {"TINY_HOST_SECONDS", "1"}});
  EXPECT_EQ(held.end, "signal 14");
  EXPECT_THAT(held.standardOutput, EndsWith("crashed\n"));
}

/// The control of the three above.
TEST(FaultLock, IsNotThereAfterAPlainCrash) {
  for (const char* used : {"malloc", "stdout", "exit"}) {
    EXPECT_EQ(driveFaulty("null_store", "dispatch:52", {{"TINY_HOST_ON_CRASH", used}}).end, "exit status 8");
  }
}

TEST(FaultThatWaits, CrashesWhenTheProcessEnds) {
  for (const char* kind : {"crash_in_atexit", "crash_in_static_destructor"}) {
    const ProgramRun run = driveFaulty(kind, "dispatch:52");
    EXPECT_EQ(run.end, "signal 11") << kind;
    EXPECT_THAT(run.standardOutput, AllOf(StartsWith(kWholeRun), EndsWith("closed\n")));
  }
}

TEST(FaultThatStays, HangsAsleepOrAwake) {
  for (const char* kind : {"hang", "spin"}) {
    const ProgramRun run = driveFaulty(kind, "dispatch:52", {{"TINY_HOST_SECONDS", "1"}});
    EXPECT_EQ(run.end, "signal 14") << kind;
    EXPECT_THAT(run.standardOutput, EndsWith("text of 5\n"));
  }
}

TEST(FaultOfTheProcess, ClosesStdout) {
  const ProgramRun run = driveFaulty("close_stdout", "dispatch:45");
  EXPECT_EQ(run.end, "exit status 7") << "the tiny host ends so when it cannot write";
  EXPECT_THAT(run.standardOutput, EndsWith("opened\n"));
}

TEST(FaultOfTheProcess, FloodsStdoutAndGoesOn) {
  const ProgramRun run = driveFaulty("flood_stdout", "dispatch:45");
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.standardOutput.size(), Ge(8388608u));
  EXPECT_THAT(run.standardOutput, EndsWith("closed\n"));
}

TEST(FaultOfTheProcess, LeavesAChildThatKeepsStdout) {
  const ProgramRun run = driveFaulty("fork_keeping_stdout", "dispatch:45");
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.elapsedSeconds, Lt(15));
  EXPECT_THAT(run.standardOutput, AllOf(StartsWith(kWholeRun), EndsWith("closed\n")));
}

TEST(FaultOfTheProcess, ChangesTheDirectory) {
  EXPECT_THAT(driveFaulty("change_locale_and_directory", "dispatch:45").standardOutput,
              EndsWith("in /\nclosed\n"));
  EXPECT_THAT(driveFaulty("_exit", "dispatch:45:2").standardOutput, Not(HasSubstr("in /\n")));
}

TEST(FaultOfTheProcess, TrapsFloatingPoint) {
  const ProgramRun run = driveFaulty("trap_floating_point", "dispatch:45");
  EXPECT_EQ(run.end, "signal 8");
  EXPECT_THAT(run.standardOutput, EndsWith("tail of 0\n"));
}

TEST(FaultOfTheProcess, AnswersLongTexts) {
  const ProgramRun run = driveFaulty("long_texts", "entry");
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.standardOutput, HasSubstr("opened\ntext of 3999\ntext of 3999\ntail of 0\n"));
}

TEST(FaultOfTheProcess, AnswersOneRequestWithALongText) {
  EXPECT_THAT(driveFaulty("long_texts:45", "entry").standardOutput,
              HasSubstr("opened\ntext of 3999\ntext of 5\ntail of 0\n"));
}

TEST(FaultOfTheProcess, CrashesInEveryExitHandler) {
  const ProgramRun run = driveFaulty("crash_in_every_atexit", "dispatch:52");
  EXPECT_EQ(run.end, "signal 11");
  EXPECT_THAT(run.standardOutput, AllOf(StartsWith(kWholeRun), EndsWith("closed\n")));
}

TEST(FaultOfTheProcess, BlocksSignalsAndGoesOn) {
  const ProgramRun run = driveFaulty("block_signals+raise:SIGTERM", "dispatch:45");
  EXPECT_EQ(run.end, "exit status 0") << "the signal waits for ever";
  EXPECT_EQ(driveFaulty("block_signals+raise:SIGSEGV", "dispatch:45").end, "signal 11");
}

}  // namespace
