// SPDX-License-Identifier: MIT
// Runs that end at a failure: the failure line, and what the plug-in is asked after the failure.
#include <cstdio>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "driver/report.h"
#include "driver/torture_run.h"
#include "gmock/gmock.h"
#include "support/exceptions.h"
#include "tests/driver/torture_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAreArray;
using testing::EndsWith;

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

  // Makes the n-th request with this opcode fail. The count is shared, as the instance copies its hook.
  static void failAt(RecordingEffect& effect, VstEffectOpcode opcode, int n, std::function<void()> fail) {
    effect.onRequest = [left = std::make_shared<int>(n), opcode,
                        fail = std::move(fail)](const Request& received) {
      if (received.kind == Request::Kind::kDispatch && received.opcode == opcode && --*left == 0) fail();
    };
  }

  bool isShellPlugin = true;
};

struct FailureCase {
  const char* name;
  int instance;
  VstEffectOpcode opcode;
  int occurrence;
  const char* lastLines;  // The step line before the failure, if any, and the failure line.
  Requests requestsAfterIt;
};

class FailingRunAt : public FailingRun, public testing::WithParamInterface<FailureCase> {};

TEST_P(FailingRunAt, ClosesEveryInstanceAndThenPrintsTheFailureLine) {
  RecordingEffect& failing = GetParam().instance == 1 ? first : second;
  std::size_t requestsUntilFailure = 0;
  failAt(failing, GetParam().opcode, GetParam().occurrence, [&] {
    requestsUntilFailure = failing.requests().size();
    failing.onRequest = [](const Request& received) {
      if (received.opcode == effClose) std::printf("(closed)");
    };
    if (GetParam().opcode == effClose) std::printf("(closed)");
    throw 5;
  });
  EXPECT_FALSE(run());
  EXPECT_FALSE(isShellPlugin);
  EXPECT_THAT(output(), EndsWith(GetParam().lastLines));
  Requests after = failing.requests();
  after.erase(after.begin(), after.begin() + static_cast<std::ptrdiff_t>(requestsUntilFailure));
  EXPECT_THAT(after, ElementsAreArray(GetParam().requestsAfterIt));
  EXPECT_EQ(plugin.instancesAlive(), 0);
}

const Requests kClose = {request(effClose)};

INSTANTIATE_TEST_SUITE_P(Places, FailingRunAt,
                         testing::ValuesIn(std::vector<FailureCase>{
                             {"Creation", 1, effGetPlugCategory, 1,
                              "(closed)!create and initialize failed 5\n", kClose},
                             {"Description", 1, effGetVstVersion, 1,
                              "1, test gathering info\n(closed)!gather info failed 5\n", kClose},
                             {"TestThatLeftThePluginOn",
                              1,
                              effSetBypass,
                              1,
                              "5, testing setting states\n(closed)!test setting state failed 5\n",
                              {mainsChanged(0), request(effClose)}},
                             {"CloseAtTheReCreation",
                              1,
                              effClose,
                              1,
                              "14, initialize\n(closed)!delete, create and initialize failed 5\n",
                              {}},
                             {"SecondDescription", 2, effGetVstVersion, 1,
                              "15, test gathering info\n(closed)!gather info failed 5\n", kClose},
                             {"LastRandomTest", 2, effGetTailSize, 50,
                              "65, inspect latency\n(closed)!inspect latency test failed 5\n", kClose},
                             {"CloseAtTheEnd",
                              2,
                              effClose,
                              1,
                              "65, inspect latency\n(closed)!inspect latency test failed 5\n",
                              {}},
                         }),
                         [](const auto& tested) { return tested.param.name; });

struct ThrownCase {
  const char* name;
  void (*raise)();
};

class UnknownError : public FailingRun, public testing::WithParamInterface<ThrownCase> {};

TEST_P(UnknownError, IsEverythingButAPlainInt) {
  failAt(first, effGetPlugCategory, 1, GetParam().raise);
  EXPECT_FALSE(run());
  EXPECT_EQ(output(), "!create and initialize failed, unknown error\n");
}

INSTANTIATE_TEST_SUITE_P(Thrown, UnknownError,
                         testing::ValuesIn(std::vector<ThrownCase>{
                             {"Unsigned", [] { throw 5U; }},
                             {"Long", [] { throw 5L; }},
                             {"Text", [] { throw "text"; }},
                             {"String", [] { throw std::string("text"); }},
                             {"NiduException", [] { throw NiduException(); }},
                         }),
                         [](const auto& tested) { return tested.param.name; });

TEST_F(FailingRun, PrintsTheFirstFailureWhenTheCloseAfterItThrowsToo) {
  first.onRequest = [](const Request& received) {
    if (received.kind != Request::Kind::kDispatch) return;
    if (received.opcode == effGetVstVersion) throw 5;
    if (received.opcode == effClose) throw 6;
  };
  EXPECT_FALSE(run());
  EXPECT_EQ(output(), "total, 64\n1, test gathering info\n!gather info failed 5\n");
}

TEST_F(FailingRun, PrintsTheFirstFailureWhenBothInstancesThrowAtTheirClose) {
  failAt(first, effClose, 1, [] { throw 5; });
  failAt(second, effClose, 1, [] { throw 6; });
  EXPECT_FALSE(run());
  EXPECT_THAT(output(), EndsWith("14, initialize\n!delete, create and initialize failed 5\n"));
  EXPECT_EQ(second.timesClosed(), 1);
}

TEST_F(FailingRun, OfAShellSaysThatItIsAShell) {
  isShellPlugin = false;
  first.answer(effGetPlugCategory, 10);
  failAt(first, effShellGetNextPlugin, 1, [] { throw 5; });
  EXPECT_FALSE(run());
  EXPECT_TRUE(isShellPlugin);
  EXPECT_EQ(output(), "total, 51\n1, test gathering info\n!gather info failed 5\n");
}

}  // namespace
