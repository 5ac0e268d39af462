// SPDX-License-Identifier: MIT
// Runs that end at a failure: the failure line, what the plug-in is still asked, and the crash on purpose
// where there is no instance.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <memory>
#include <new>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <unistd.h>

#include "driver/crash_exit.h"
#include "driver/crash_guard.h"
#include "driver/report.h"
#include "driver/torture_run.h"
#include "gmock/gmock.h"
#include "support/exceptions.h"
#include "tests/driver/torture_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::EndsWith;
using testing::IsEmpty;
using testing::SizeIs;

// One place of a run: the request, of the first or the second instance, and its how-many-th occurrence.
struct FailureCase {
  const char* name;
  int instance;
  VstEffectOpcode opcode;
  int occurrence;
  const char* phase;
  const char* lastStep;  // The step line before the failure; empty where there is none yet.
};

void PrintTo(const FailureCase& failure, std::ostream* stream) { *stream << failure.name; }

class FailingRun : public TortureFixture {
 protected:
  FailingRun() {
    first.setPrograms({{"Soft", {0.5F}}});
    second.setPrograms({{"Soft", {0.5F}}});
  }
  void SetUp() override {
    TortureFixture::SetUp();
    plugin.willCreate(first);
    plugin.willCreate(second);
    scriptedDraws.assign(50, 2147483647);  // Each of the random tests is number 4.
  }

  bool run() { return RunVSTTortureTest("/test.vst", VST_loadID{}, isShellPlugin); }

  // What follows the last occurrence of `opcode` in an instance's requests.
  static Requests requestsAfter(const RecordingEffect& effect, VstEffectOpcode opcode) {
    Requests following;
    for (const Request& received : effect.requests()) {
      following.push_back(received);
      if (received.kind == Request::Kind::kDispatch && received.opcode == opcode) following.clear();
    }
    return following;
  }

  // Makes the n-th request with this opcode fail. The count is shared, as the instance copies its hook.
  static void failAt(RecordingEffect& effect, VstEffectOpcode opcode, int n, std::function<void()> fail) {
    effect.onRequest = [left = std::make_shared<int>(n), opcode,
                        fail = std::move(fail)](const Request& received) {
      if (received.kind == Request::Kind::kDispatch && received.opcode == opcode && --*left == 0) fail();
    };
  }

  bool isShellPlugin = true;
};

class FailingRunAt : public FailingRun, public testing::WithParamInterface<FailureCase> {
 protected:
  bool runAndFailWith(std::function<void()> fail) {
    failAt(GetParam().instance == 1 ? first : second, GetParam().opcode, GetParam().occurrence,
           std::move(fail));
    return run();
  }
  static std::string ending(const std::string& failureLine) { return GetParam().lastStep + failureLine; }
};

TEST_P(FailingRunAt, NamesThePhaseAndTheCode) {
  EXPECT_FALSE(runAndFailWith([] { throw 5; }));
  EXPECT_FALSE(isShellPlugin);
  EXPECT_THAT(output(), EndsWith(ending(std::string("!") + GetParam().phase + " failed 5\n")));
  EXPECT_STREQ(gCurTest, GetParam().phase);
}

TEST_P(FailingRunAt, NamesThePhaseOfAnUnknownError) {
  EXPECT_FALSE(runAndFailWith([] { throw std::runtime_error("from the plug-in"); }));
  EXPECT_FALSE(isShellPlugin);
  EXPECT_THAT(output(), EndsWith(ending(std::string("!") + GetParam().phase + " failed, unknown error\n")));
}

// Each instance that was opened is closed once, with its last request; only the close itself may fail.
TEST_P(FailingRunAt, ClosesWhatIsOpenAndAsksNothingElse) {
  EXPECT_FALSE(runAndFailWith([] { throw 5; }));
  RecordingEffect& failed = GetParam().instance == 1 ? first : second;
  const Requests following = requestsAfter(failed, GetParam().opcode);
  if (GetParam().opcode == effClose) {
    EXPECT_THAT(following, IsEmpty());
  } else if (GetParam().opcode == effSetBypass) {
    EXPECT_THAT(following, ElementsAre(mainsChanged(0), request(effClose)));
  } else {
    EXPECT_THAT(following, ElementsAre(request(effClose)));
  }
  EXPECT_EQ(first.timesClosed(), 1);
  EXPECT_EQ(second.timesClosed(), static_cast<int>(plugin.entryCalls().size()) - 1);
  EXPECT_EQ(plugin.instancesAlive(), 0);
}

// The plug-in is closed before the failure line is printed.
TEST_P(FailingRunAt, ClosesThePluginBeforeItSpeaks) {
  RecordingEffect& failing = GetParam().instance == 1 ? first : second;
  EXPECT_FALSE(runAndFailWith([&failing] {
    failing.onRequest = [](const Request& received) {
      if (received.kind == Request::Kind::kDispatch && received.opcode == effClose) std::printf("closing, ");
    };
    if (GetParam().opcode == effClose) std::printf("closing, ");
    throw 5;
  }));
  EXPECT_THAT(output(), EndsWith(ending(std::string("closing, !") + GetParam().phase + " failed 5\n")));
}

INSTANTIATE_TEST_SUITE_P(
    Places, FailingRunAt,
    testing::ValuesIn(std::vector<FailureCase>{
        {"Creation", 1, effGetPlugCategory, 1, "create and initialize", ""},
        {"Description", 1, effGetVstVersion, 1, "gather info", "1, test gathering info\n"},
        {"Test0", 1, effGetOutputProperties, 1, "inspect class info test", "2, inspect class info\n"},
        {"Test1", 1, effGetProgramName, 1, "inspect preset info test", "3, inspect preset info\n"},
        {"Test2", 1, effString2Parameter, 1, "inspect parameter info test", "4, inspect parameter info\n"},
        {"Test3", 1, effSetBypass, 1, "test setting state", "5, testing setting states\n"},
        {"Test4", 1, effGetTailSize, 1, "inspect latency test", "6, inspect latency\n"},
        {"Test4OnTheWayBack", 1, effGetTailSize, 2, "inspect latency test", "9, inspect latency\n"},
        {"Test0OnTheWayBack", 1, effGetOutputProperties, 2, "inspect class info test",
         "13, inspect class info\n"},
        {"CloseAtTheReCreation", 1, effClose, 1, "delete, create and initialize", "14, initialize\n"},
        {"SecondDescription", 2, effGetVstVersion, 1, "gather info", "15, test gathering info\n"},
        {"FirstRandomTest", 2, effGetTailSize, 1, "inspect latency test", "16, inspect latency\n"},
        {"LastRandomTest", 2, effGetTailSize, 50, "inspect latency test", "65, inspect latency\n"},
        {"CloseAtTheEnd", 2, effClose, 1, "inspect latency test", "65, inspect latency\n"},
    }),
    [](const auto& tested) { return tested.param.name; });

TEST_F(FailingRun, AMissingBundlePrintsOneLine) {
  EXPECT_FALSE(RunVSTTortureTest("/zzz.vst", VST_loadID{}, isShellPlugin));
  EXPECT_FALSE(isShellPlugin);
  EXPECT_EQ(output(), "!create and initialize failed -1\n");
  EXPECT_THAT(plugin.entryCalls(), IsEmpty());
}

TEST_F(FailingRun, ABundleWithoutAnExecutablePrintsOneLine) {
  core_foundation.addBundleWithoutExecutable("/zzz.vst");
  EXPECT_FALSE(RunVSTTortureTest("/zzz.vst", VST_loadID{}, isShellPlugin));
  EXPECT_EQ(output(), "!create and initialize failed -1\n");
}

TEST_F(FailingRun, ACreationThatThrowsAnythingElsePrintsOneLine) {
  failAt(first, effGetPlugCategory, 1, [] { throw std::bad_alloc(); });
  EXPECT_FALSE(run());
  EXPECT_EQ(output(), "!create and initialize failed, unknown error\n");
}

TEST_F(FailingRun, OnlyAPlainIntHasACode) {
  const std::vector<std::function<void()>> failures = {
      [] { throw 5U; }, [] { throw 5L; }, [] { throw "text"; }, [] { throw std::string("text"); },
      [] { throw NiduException(); }};
  for (const auto& fail : failures) {
    RecordingEffect third;
    InProcessPlugin other(core_foundation, "/other.vst");
    other.willCreate(third);
    failAt(third, effGetPlugCategory, 1, fail);
    EXPECT_FALSE(RunVSTTortureTest("/other.vst", VST_loadID{}, isShellPlugin));
    VSTPluginLoader::fLoadedDLLs = decltype(VSTPluginLoader::fLoadedDLLs)();
  }
  std::string expected;
  for (int i = 0; i < 5; ++i) expected += "!create and initialize failed, unknown error\n";
  EXPECT_EQ(output(), expected);
}

TEST_F(FailingRun, ACloseThatThrowsBehindAFailureDoesNotReplaceIt) {
  first.onRequest = [](const Request& received) {
    if (received.kind != Request::Kind::kDispatch) return;
    if (received.opcode == effGetVstVersion) throw 5;
    if (received.opcode == effClose) throw 6;
  };
  EXPECT_FALSE(run());
  EXPECT_EQ(output(), "total, 64\n1, test gathering info\n!gather info failed 5\n");
}

TEST_F(FailingRun, TwoClosesThatThrowAreOneFailure) {
  failAt(first, effClose, 1, [] { throw 5; });
  failAt(second, effClose, 1, [] { throw 6; });
  EXPECT_FALSE(run());
  EXPECT_THAT(output(), EndsWith("14, initialize\n!delete, create and initialize failed 5\n"));
  EXPECT_EQ(second.timesClosed(), 1);
}

TEST_F(FailingRun, AThrowingParameterFunctionIsNoFailure) {
  first.onRequest = [](const Request& received) {
    if (received.kind != Request::Kind::kDispatch) throw 5;
  };
  EXPECT_TRUE(run());
}

TEST_F(FailingRun, HostileCountsAreFailuresOfTheirPhase) {
  first.aeffect.flags = 32;
  first.answer(effGetChunk, -1);
  EXPECT_FALSE(run());
  EXPECT_THAT(output(), EndsWith("5, testing setting states\n!test setting state failed -1\n"));
}

TEST_F(FailingRun, AShellThatFailsIsAShellAllTheSame) {
  isShellPlugin = false;
  first.answer(effGetPlugCategory, 10);
  failAt(first, effShellGetNextPlugin, 1, [] { throw 5; });
  EXPECT_FALSE(run());
  EXPECT_TRUE(isShellPlugin);
  EXPECT_EQ(output(), "total, 51\n1, test gathering info\n!gather info failed 5\n");
  EXPECT_EQ(first.timesClosed(), 1);
}

// ---- No instance: the crash on purpose, behind the guard as main() sets it up ----

// In a child whose standard output is the standard error that the test reads. The child leaves its memory to
// the system, as the program does at a crash.
class CrashingRunDeathTest : public TortureFixture {
 protected:
  void SetUp() override {
    TortureFixture::SetUp();
#ifdef __SANITIZE_THREAD__
    GTEST_SKIP()
        << "a forked child under the thread sanitizer does not end as the program does; the end-to-end "
           "tests run the program itself";
#endif
    GTEST_FLAG_SET(death_test_style, "fast");
  }
  [[noreturn]] void runBehindTheGuard() {
    dup2(STDERR_FILENO, STDOUT_FILENO);
    openReport();
    const CPPAutoReleasePool pool(7);
    std::atexit(atExitFunction);
    bool isShellPlugin = false;
    RunVSTTortureTest("/test.vst", VST_loadID{}, isShellPlugin);
    _exit(99);
  }
};

TEST_F(CrashingRunDeathTest, WithoutAnInstanceEndsBeforeTheFirstLine) {
  plugin.willRefuse();
  EXPECT_EXIT(runBehindTheGuard(), testing::ExitedWithCode(7), "^unexpected exit$");
}

TEST_F(CrashingRunDeathTest, APluginThatThrowsDuringItsCreationYieldsNone) {
  plugin.willThrow();
  EXPECT_EXIT(runBehindTheGuard(), testing::ExitedWithCode(7), "^unexpected exit$");
}

TEST_F(CrashingRunDeathTest, WithoutASecondInstanceEndsAtTheFirstRandomTest) {
  plugin.willCreate(first);
  plugin.willRefuse();
  EXPECT_EXIT(runBehindTheGuard(), testing::ExitedWithCode(7),
              "^total, 64\n(.*\n)+14, initialize\n15, test gathering info\n16, inspect class info\n"
              "unexpected exit$");
}

}  // namespace
