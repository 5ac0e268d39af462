// SPDX-License-Identifier: MIT
// The lines on standard output, character by character, and that each is flushed at once.
#include <climits>
#include <cstdio>
#include <string>
#include <vector>

#include <fcntl.h>
#include <unistd.h>

#include "driver/report.h"
#include "gtest/gtest.h"

namespace {

/// Standard output is a pipe, as for a host, from which only flushed text can be read.
class PipedReport : public testing::Test {
 protected:
  void SetUp() override {
    openReport();
    int ends[2];
    ASSERT_EQ(pipe(ends), 0);
    std::fflush(stdout);
    original = dup(1);
    dup2(ends[1], 1);
    close(ends[1]);
    readEnd = ends[0];
    fcntl(readEnd, F_SETFL, O_NONBLOCK);
  }
  void TearDown() override {
    std::fflush(stdout);
    dup2(original, 1);
    close(original);
    close(readEnd);
    gCurTest = nullptr;
  }
  std::string received() const {
    char text[256];
    const ssize_t size = read(readEnd, text, sizeof text);
    return size <= 0 ? "" : std::string(text, static_cast<std::size_t>(size));
  }

  int original = -1;
  int readEnd = -1;
};

struct LineCase {
  const char* name;
  const char* phase;  // Null before the first phase.
  void (*print)();
  const char* line;
};

class Report : public PipedReport, public testing::WithParamInterface<LineCase> {};

TEST_P(Report, FlushesTheLine) {
  gStep = 64;
  gCurTest = GetParam().phase;
  GetParam().print();
  EXPECT_EQ(received(), GetParam().line);
}

INSTANTIATE_TEST_SUITE_P(
    Lines, Report,
    testing::ValuesIn(std::vector<LineCase>{
        {"Usage", nullptr, printUsage, "!too few arguments. syntax is command pathtovst childID(optional)\n"},
        {"Total", nullptr, [] { printTotal(51); }, "total, 51\n"},
        {"Step", "gather info", [] { printStep("initialize"); }, "65, initialize\n"},
        {"FailureWithACode", "delete, create and initialize", [] { printFailure(-1); },
         "!delete, create and initialize failed -1\n"},
        {"FailureWithTheHighestCode", "gather info", [] { printFailure(INT_MAX); },
         "!gather info failed 2147483647\n"},
        {"FailureWithoutACode", "gather info", [] { printFailure(); },
         "!gather info failed, unknown error\n"},
        {"CodeBeforeTheFirstPhase", nullptr, [] { printFailure(-1); }, "! failed -1\n"},
        {"UnknownErrorBeforeTheFirstPhase", nullptr, [] { printFailure(); }, "! failed, unknown error\n"},
        {"PercentSignsInAStep", nullptr, [] { printStep("50%s"); }, "65, 50%s\n"},
        {"PercentSignsInAPhaseWithACode", "100%s %d%n", [] { printFailure(5); }, "!100%s %d%n failed 5\n"},
        {"PercentSignsInAPhase", "100%s %d%n", [] { printFailure(); }, "!100%s %d%n failed, unknown error\n"},
    }),
    [](const auto& tested) { return tested.param.name; });

TEST_F(PipedReport, CountsStepLinesOnly) {
  gStep = 0;
  gCurTest = "gather info";
  printTotal(64);
  printStep("initialize");
  printFailure(5);
  printStep("inspect class info");
  EXPECT_EQ(gStep, 2);
  EXPECT_EQ(received(), "total, 64\n1, initialize\n!gather info failed 5\n2, inspect class info\n");
}

}  // namespace
