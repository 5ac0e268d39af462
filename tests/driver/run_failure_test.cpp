// SPDX-License-Identifier: MIT
// Runs that end at failures which the faulty sample does not have. The failure lines of all others are in
// tests/fault_matrix, the requests after them in tests/end_to_end.
#include <string>
#include <vector>

#include "driver/torture_run.h"
#include "gmock/gmock.h"
#include "support/exceptions.h"
#include "tests/driver/torture_fixture.h"

namespace {

using namespace doubles;
using testing::EndsWith;

class FailingRun : public TortureFixture {
 protected:
  void SetUp() override {
    TortureFixture::SetUp();
    plugin.willCreate(first);
    plugin.willCreate(second);
  }

  bool run() { return RunVSTTortureTest("/test.vst", VST_loadID{}, isShellPlugin); }

  static void failAt(RecordingEffect& effect, VstEffectOpcode opcode, void (*raise)()) {
    effect.onRequest = [=](const Request& received) {
      if (received.kind == Request::Kind::kDispatch && received.opcode == opcode) raise();
    };
  }

  bool isShellPlugin = true;
};

struct ThrownCase {
  const char* name;
  void (*raise)();
};

class UnknownError : public FailingRun, public testing::WithParamInterface<ThrownCase> {};

TEST_P(UnknownError, IsEverythingButAPlainInt) {
  failAt(first, effGetPlugCategory, GetParam().raise);
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
  failAt(first, effClose, [] { throw 5; });
  failAt(second, effClose, [] { throw 6; });
  EXPECT_FALSE(run());
  EXPECT_THAT(output(), EndsWith("14, initialize\n!delete, create and initialize failed 5\n"));
  EXPECT_EQ(second.timesClosed(), 1);
}

TEST_F(FailingRun, OfAShellSaysThatItIsAShell) {
  isShellPlugin = false;
  first.answer(effGetPlugCategory, 10);
  failAt(first, effShellGetNextPlugin, [] { throw 5; });
  EXPECT_FALSE(run());
  EXPECT_TRUE(isShellPlugin);
  EXPECT_EQ(output(), "total, 51\n1, test gathering info\n!gather info failed 5\n");
}

}  // namespace
