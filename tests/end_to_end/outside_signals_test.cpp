// SPDX-License-Identifier: MIT
// Signals that a host sends to a run which has hung: one line more, a known status, and soon.
#include <csignal>

#include <gmock/gmock.h>

#include "tests/shared/program_run.h"
#include "tests/shared/protocol_lines.h"
#include "tests/shared/sanitizer.h"

using testing::Lt;

namespace {

/// Hangs in step 6. The signals are sent the moment its line has come, which may be before it hangs.
ProgramCall hanging(const std::string& kind, const std::vector<int>& signals) {
  ProgramCall call;
  call.arguments = {samplePlugin("faulty")};
  call.environment = {{"FAULT_KIND", kind}, {"FAULT_PLACE", "dispatch:52"}};
  call.interruption.signals = signals;
  call.interruption.afterText = "6, inspect latency\n";
  return call;
}

// Seen: the second handler waits for the lock that the first one's prologue holds.
const NotWith kNoNestedHandlers = {
    "the sanitizer takes a lock before a handler begins, so that a second signal then waits for ever", ""};

struct Ending {
  std::string name;
  std::vector<int> signals;
  std::string kind = "hang";
};

class SignalFromOutside : public testing::TestWithParam<Ending> {};

TEST_P(SignalFromOutside, EndsARunThatHangs) {
  const std::string reason = GetParam().signals.size() > 1 ? kNoNestedHandlers.reason() : "";
  if (!reason.empty()) GTEST_SKIP() << reason;
  const ProgramCall call = hanging(GetParam().kind, GetParam().signals);
  const ProgramRun run = runVstTorture(call);
  EXPECT_EQ(run.standardOutput, beginningOfRun(6) + "unexpected exit");
  EXPECT_EQ(run.standardError, "");
  EXPECT_EQ(run.end, "exit status 7");
  EXPECT_THAT(run.secondsSinceInterruption, Lt(kEndLimitInSeconds));
}

INSTANTIATE_TEST_SUITE_P(Signals, SignalFromOutside,
                         testing::Values(Ending{"SIGTERM", {SIGTERM}}, Ending{"SIGINT", {SIGINT}},
                                         Ending{"SIGHUP", {SIGHUP}}, Ending{"SIGSEGV", {SIGSEGV}},
                                         Ending{"SIGABRT", {SIGABRT}}, Ending{"SIGBUS", {SIGBUS}},
                                         Ending{"TwoInARow", {SIGTERM, SIGINT}},
                                         Ending{"TheSameTwice", {SIGTERM, SIGTERM}},
                                         Ending{"ThreeInARow", {SIGHUP, SIGINT, SIGTERM}},
                                         Ending{"SIGTERMWhileItSpins", {SIGTERM}, "spin"},
                                         Ending{"TwoInARowWhileItSpins", {SIGINT, SIGTERM}, "spin"}),
                         [](const auto& instance) { return instance.param.name; });

// The second signal may come while the first one's last words are being written.
TEST(TwoSignals, SayTheLastWordsOnceAtAnyDistance) {
  if (!kNoNestedHandlers.reason().empty()) GTEST_SKIP() << kNoNestedHandlers.reason();
  ProgramCall call = hanging("hang", {SIGTERM, SIGINT});
  call.interruption.afterSeconds = 0.001;
  for (int i = 0; i < 100; ++i) {
    call.interruption.secondsBetween = i * 1e-6;
    const ProgramRun run = runVstTorture(call);
    ASSERT_EQ(run.standardOutput, beginningOfRun(6) + "unexpected exit") << i;
    ASSERT_EQ(run.end, "exit status 7") << i;
  }
}

}  // namespace
