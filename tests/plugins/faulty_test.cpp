// SPDX-License-Identifier: MIT
// Each fault of the faulty sample does to its process what its name says, at the place asked for.
#include <algorithm>
#include <cctype>

#include <gmock/gmock.h>

#include "tests/shared/program_run.h"

using testing::AllOf;
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
                       const std::map<std::string, std::string>& environment = {}) {
  ProgramCall call = faultyPlugin(kind, place);
  call.environment.insert({"FAULT_STATUS", "23"});
  call.environment.insert(environment.begin(), environment.end());
  return runProgram(TINY_HOST, call);
}

std::string identifier(std::string text) {
  std::replace_if(
      text.begin(), text.end(), [](unsigned char letter) { return std::isalnum(letter) == 0; }, '_');
  return text;
}

struct Ending {
  std::string kind;
  std::string end;
};

class FaultThatEnds : public testing::TestWithParam<Ending> {};

TEST_P(FaultThatEnds, EndsTheProcessAtOnce) {
  const ProgramRun run = driveFaulty(GetParam().kind, "dispatch:52");
  EXPECT_EQ(run.end, GetParam().end) << run.standardError;
  EXPECT_THAT(run.standardOutput, StartsWith("loaded\nmade 1466058086\nopened\ntext of 19\ntext of 5\n"));
  EXPECT_THAT(run.standardOutput, Not(HasSubstr("tail of")));
}

INSTANTIATE_TEST_SUITE_P(
    Faulty, FaultThatEnds,
    testing::Values(
        Ending{"null_store", "signal 11"}, Ending{"write_read_only", "signal 11"},
        Ending{"stack_overflow", "signal 11"}, Ending{"abort", "signal 6"}, Ending{"terminate", "signal 6"},
        Ending{"throw_int", "exit status 9"}, Ending{"throw_runtime_error", "exit status 9"},
        Ending{"throw_struct", "exit status 9"}, Ending{"exit", "exit status 23"},
        Ending{"_exit", "exit status 23"}, Ending{"quick_exit", "exit status 23"},
        Ending{"raise:SIGHUP", "signal 1"}, Ending{"raise:SIGINT", "signal 2"},
        Ending{"raise:SIGTRAP", "signal 5"}, Ending{"raise:SIGBUS", "signal 7"},
        Ending{"raise:SIGKILL", "signal 9"}, Ending{"raise:SIGTERM", "signal 15"},
        Ending{"raise:SIGSYS", "signal 31"}, Ending{"raise:SIGNOTHING", "exit status 125"},
        Ending{"divide_by_zero", "signal 8"}, Ending{"illegal_instruction", "signal 4"},
        Ending{"double_free", "signal 6"}, Ending{"heap_corruption", "signal 6"},
        Ending{"crash_with_heap_lock", "signal 6"}, Ending{"crash_with_stdout_lock", "signal 11"},
        Ending{"crash_with_own_stdout_lock", "signal 11"}, Ending{"crash_under_destructor_lock", "signal 11"},
        Ending{"thread_crash", "signal 11"}, Ending{"thread_stack_overflow", "signal 11"},
        Ending{"exec", "exit status 9"}, Ending{"thread_throw", "signal 6"},
        Ending{"replace_handlers_then_crash", "signal 11"}, Ending{"block_signals_then_crash", "signal 11"},
        Ending{"block_signals+raise:SIGSEGV", "signal 11"}, Ending{"no_such_fault", "exit status 125"}),
    [](const auto& instance) { return identifier(instance.param.kind); });

TEST(Faulty, BehavesWellWithoutAPlace) {
  ProgramCall call;
  call.arguments = {samplePlugin("faulty")};
  const ProgramRun run = runProgram(TINY_HOST, call);
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.standardOutput,
              AllOf(StartsWith(kWholeRun), EndsWith("closed\n"), Not(HasSubstr("in /\n"))));
}

TEST(Faulty, ThrowsWhatItsKindSays) {
  EXPECT_THAT(driveFaulty("throw_int", "entry").standardOutput, EndsWith("caught int 5\n"));
  EXPECT_THAT(driveFaulty("throw_runtime_error", "entry").standardOutput,
              EndsWith("caught exception a fault on purpose\n"));
  EXPECT_THAT(driveFaulty("throw_struct", "entry").standardOutput, EndsWith("caught something\n"));
}

struct PlaceReached {
  std::string place;
  std::string lastLine;
  std::string end;
};

class FaultPlace : public testing::TestWithParam<PlaceReached> {};

TEST_P(FaultPlace, IsWhereItHappens) {
  const ProgramRun run = driveFaulty("_exit", GetParam().place);
  EXPECT_EQ(run.end, GetParam().end);
  const std::vector<std::string> output = lines(run.standardOutput);
  EXPECT_EQ(output.empty() ? "" : output.back(), GetParam().lastLine);
}

// The tiny host makes each request once, and sets a parameter twice. 125: there is no such place.
INSTANTIATE_TEST_SUITE_P(Faulty, FaultPlace,
                         testing::Values(PlaceReached{"load", "", "exit status 23"},
                                         PlaceReached{"entry", "loaded", "exit status 23"},
                                         PlaceReached{"dispatch:0", "made 1466058086", "exit status 23"},
                                         PlaceReached{"dispatch:7", "text of 19", "exit status 23"},
                                         PlaceReached{"getParameter", "text of 5", "exit status 23"},
                                         PlaceReached{"setParameter:2", "text of 5", "exit status 23"},
                                         PlaceReached{"setParameter:3", "closed", "exit status 0"},
                                         PlaceReached{"dispatch:0:2", "closed", "exit status 0"},
                                         PlaceReached{"elsewhere", "", "exit status 125"},
                                         PlaceReached{"dispatch", "", "exit status 125"},
                                         PlaceReached{"dispatch:open", "", "exit status 125"},
                                         PlaceReached{"entry:0", "", "exit status 125"},
                                         PlaceReached{"getParameter:1x", "", "exit status 125"}),
                         [](const auto& instance) { return identifier(instance.param.place); });

struct Lock {
  std::string kind;
  std::string use;  ///< What the tiny host does in its handler of the crash.
  std::string end;  ///< SIGALRM (14) a second after the crash where the lock is held.
};

class FaultLock : public testing::TestWithParam<Lock> {};

TEST_P(FaultLock, IsHeldDuringTheCrashesThatAreNamedForIt) {
  const bool isHeld = GetParam().end == "signal 14";
  const ProgramRun run =
      driveFaulty(GetParam().kind, "dispatch:52",
                  {{"TINY_HOST_ON_CRASH", GetParam().use}, {"TINY_HOST_SECONDS", isHeld ? "1" : "20"}});
  EXPECT_EQ(run.end, GetParam().end);
  EXPECT_THAT(run.standardOutput, HasSubstr("crashed\n"));
}

INSTANTIATE_TEST_SUITE_P(Faulty, FaultLock,
                         testing::Values(Lock{"crash_with_heap_lock", "malloc", "signal 14"},
                                         Lock{"crash_with_stdout_lock", "stdout", "signal 14"},
                                         Lock{"crash_under_destructor_lock", "exit", "signal 14"},
                                         Lock{"crash_with_own_stdout_lock", "stdout", "exit status 8"},
                                         // Control cases: a plain crash holds no lock.
                                         Lock{"null_store", "malloc", "exit status 8"},
                                         Lock{"null_store", "stdout", "exit status 8"},
                                         Lock{"null_store", "exit", "exit status 8"}),
                         [](const auto& instance) { return instance.param.kind + "_" + instance.param.use; });

TEST(FaultThatWaits, CrashesWhenTheProcessEnds) {
  for (const char* kind : {"crash_in_atexit", "crash_in_every_atexit", "crash_in_static_destructor"}) {
    const ProgramRun run = driveFaulty(kind, "dispatch:52");
    EXPECT_EQ(run.end, "signal 11") << kind;
    EXPECT_THAT(run.standardOutput, AllOf(StartsWith(kWholeRun), EndsWith("closed\n")));
  }
}

TEST(HangingFault, SleepsOrSpinsForEver) {
  for (const char* kind : {"hang", "spin"}) {
    const ProgramRun run = driveFaulty(kind, "dispatch:52", {{"TINY_HOST_SECONDS", "1"}});
    EXPECT_EQ(run.end, "signal 14") << kind;
    EXPECT_THAT(run.standardOutput, EndsWith("text of 5\n"));
  }
}

TEST(FaultOfTheProcess, ClosesStdout) {
  const ProgramRun run = driveFaulty("close_stdout", "dispatch:45");
  EXPECT_EQ(run.end, "exit status 7") << "the status of a tiny host that cannot write";
  EXPECT_THAT(run.standardOutput, EndsWith("opened\n"));
}

TEST(FaultOfTheProcess, FloodsStdoutAndGoesOn) {
  const ProgramRun run = driveFaulty("flood_stdout", "dispatch:45");
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.standardOutput.size(), Ge(8388608u));
  EXPECT_THAT(run.standardOutput, EndsWith("closed\n"));
}

TEST(FaultOfTheProcess, LeavesAChildThatKeepsStdoutOpen) {
  const ProgramRun run = driveFaulty("fork_keeping_stdout", "dispatch:45");
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.elapsedSeconds, Lt(30));
  EXPECT_THAT(run.standardOutput, AllOf(StartsWith(kWholeRun), EndsWith("closed\n")));
}

TEST(FaultOfTheProcess, ChangesTheDirectory) {
  EXPECT_THAT(driveFaulty("change_locale_and_directory", "dispatch:45").standardOutput,
              EndsWith("in /\nclosed\n"));
}

TEST(FaultOfTheProcess, TrapsFloatingPoint) {
  const ProgramRun run = driveFaulty("trap_floating_point", "dispatch:45");
  EXPECT_EQ(run.end, "signal 8");
  EXPECT_THAT(run.standardOutput, EndsWith("tail of 0\n"));
}

TEST(FaultOfTheProcess, AnswersOneOrAllRequestsWithALongText) {
  EXPECT_THAT(driveFaulty("long_texts:45", "entry").standardOutput,
              HasSubstr("opened\ntext of 3999\ntext of 5\ntail of 0\n"));
  const ProgramRun run = driveFaulty("long_texts", "entry");
  EXPECT_EQ(run.end, "exit status 0");
  EXPECT_THAT(run.standardOutput, HasSubstr("opened\ntext of 3999\ntext of 3999\ntail of 0\n"));
}

TEST(FaultOfTheProcess, BlocksSignalsAndGoesOn) {
  EXPECT_EQ(driveFaulty("block_signals+raise:SIGTERM", "dispatch:45").end, "exit status 0");
}

}  // namespace
