// SPDX-License-Identifier: MIT
// A value that a plug-in answers in a register wider than a float, as on 32-bit x86: what was read is
// written back as the 32-bit float that it is, finds itself in place, and is not sent.
#include <gmock/gmock.h>

#include "tests/shared/program_run.h"

using testing::Contains;
using testing::Each;
using testing::StartsWith;

namespace {

/// What the sample was asked behind the step lines of one text, in the ordered and in the drawn steps.
std::vector<std::string> requestsBehind(const std::string& test, const ProgramRun& run) {
  std::vector<std::string> found;
  bool inside = false;
  for (const std::string& line : lines(run.standardOutput)) {
    const std::size_t comma = line.find(", ");
    if (comma != std::string::npos) {
      inside = line.substr(comma + 2) == test;
    } else if (inside) {
      found.push_back(line);
    }
  }
  return found;
}

ProgramRun runOfTheSample() {
  ProgramCall call;
  call.arguments = {samplePlugin("excess_precision")};
  call.environment = {{"EXCESS_PRECISION_LOG", "/dev/stdout"}};
  return runVstTorture(call);
}

TEST(ExcessPrecision, AValueJustReadIsNeverSentBack) {
  const ProgramRun run = runOfTheSample();
  EXPECT_EQ(run.end, "exit status 0");
  const std::vector<std::string> requests = requestsBehind("inspect parameter info", run);
  EXPECT_THAT(requests, Contains("getParameter 0"));
  EXPECT_THAT(requests, Contains("getParameter 1"));
  EXPECT_THAT(requests, Each(StartsWith("getParameter ")));
}

}  // namespace
