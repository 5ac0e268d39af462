// SPDX-License-Identifier: MIT
// On 32-bit x86 a plug-in answers a value in a register that is wider than a float. The program rounds what
// it reads to a 32-bit float, so the value that it writes back equals the current one and is not sent.
#include <gmock/gmock.h>

#include "tests/shared/program_run.h"
#include "tests/shared/protocol.h"

using testing::Contains;
using testing::Each;
using testing::StartsWith;

namespace {

TEST(ExcessPrecision, AValueJustReadIsNeverSentBack) {
  ProgramCall call;
  call.arguments = {samplePlugin("excess_precision")};
  call.environment = {{"EXCESS_PRECISION_LOG", "/dev/stdout"}};
  const ProgramRun run = runVstTorture(call);
  EXPECT_EQ(run.end, "exit status 0");
  std::vector<std::string> requests;
  for (const Section& section : sections(run.standardOutput)) {
    if (section.line.text != "inspect parameter info") continue;
    requests.insert(requests.end(), section.pluginLines.begin(), section.pluginLines.end());
  }
  EXPECT_THAT(requests, Contains("getParameter 0"));
  EXPECT_THAT(requests, Contains("getParameter 1"));
  EXPECT_THAT(requests, Each(StartsWith("getParameter ")));
}

}  // namespace
