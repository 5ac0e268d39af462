// SPDX-License-Identifier: MIT
// A host sends signals to a run that hangs: "unexpected exit" follows, and the run ends soon with status 7.
#include <csignal>

#include <gmock/gmock.h>

#include "tests/shared/program_run.h"
#include "tests/shared/protocol.h"
#include "tests/shared/sanitizer.h"

using testing::Lt;

namespace {

/// Hangs in step 6. The signals are sent as soon as the step line has been read, which may be before it
/// hangs.
ProgramCall hanging(const std::string& kind, const std::vector<int>& signals) {
  ProgramCall call = faultyPlugin(kind, "dispatch:52");
  call.interruption.signals = signals;
  call.interruption.afterText = "6, inspect latency\n";
  return call;
}

// The sanitizer takes a lock before each handler; a handler that interrupts another one waits for it.
const NotWith kNotWithNestedHandlers = {"the sanitizer blocks a second signal handler for ever", ""};

// While the plug-in calls nothing, that is for ever.
const NotWith kNotWhileItSpins = {"",
                                  "the sanitizer holds a signal back until the next call of the C library"};

struct Ending {
  std::string name;
  std::vector<int> signals;
  std::string kind = "hang";
};

class SignalFromTheHost : public testing::TestWithParam<Ending> {};

TEST_P(SignalFromTheHost, EndsARunThatHangs) {
  std::string reason = GetParam().signals.size() > 1 ? kNotWithNestedHandlers.reason() : "";
  if (reason.empty() && GetParam().kind == "spin") reason = kNotWhileItSpins.reason();
  if (!reason.empty()) GTEST_SKIP() << reason;
  const ProgramRun run = runVstTorture(hanging(GetParam().kind, GetParam().signals));
  EXPECT_EQ(run.standardOutput, beginningOfRun(6) + "unexpected exit");
  EXPECT_EQ(run.standardError, "");
  EXPECT_EQ(run.end, "exit status 7");
  EXPECT_THAT(run.secondsSinceInterruption, Lt(kEndLimitInSeconds));
}

INSTANTIATE_TEST_SUITE_P(Signals, SignalFromTheHost,
                         testing::Values(Ending{"SIGTERM", {SIGTERM}}, Ending{"SIGINT", {SIGINT}},
                                         Ending{"SIGHUP", {SIGHUP}}, Ending{"SIGSEGV", {SIGSEGV}},
                                         Ending{"SIGABRT", {SIGABRT}}, Ending{"SIGBUS", {SIGBUS}},
                                         Ending{"TheSameTwice", {SIGTERM, SIGTERM}},
                                         Ending{"ThreeInARow", {SIGHUP, SIGINT, SIGTERM}},
                                         Ending{"SIGTERMWhileItSpins", {SIGTERM}, "spin"},
                                         Ending{"TwoInARowWhileItSpins", {SIGINT, SIGTERM}, "spin"}),
                         [](const auto& instance) { return instance.param.name; });

// The second signal may come while the handler of the first one writes "unexpected exit".
TEST(TwoSignals, GiveOneUnexpectedExitWhateverTheTimeBetweenThem) {
  if (!kNotWithNestedHandlers.reason().empty()) GTEST_SKIP() << kNotWithNestedHandlers.reason();
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
