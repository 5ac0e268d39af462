// SPDX-License-Identifier: MIT
// The lines on standard output, character by character.
#include <cstdio>
#include <string>
#include <thread>
#include <vector>

#include <fcntl.h>
#include <unistd.h>

#include "driver/last_words.h"
#include "driver/report.h"
#include "gmock/gmock.h"
#include "gtest/gtest.h"

namespace {

using testing::internal::CaptureStdout;
using testing::internal::GetCapturedStdout;

class Report : public testing::Test {
 protected:
  void SetUp() override {
    gStep = 0;
    gCurTest = nullptr;
    openReport();
    CaptureStdout();
  }
  void TearDown() override { gCurTest = nullptr; }
};

TEST_F(Report, Usage) {
  printUsage();
  EXPECT_EQ(GetCapturedStdout(), "!too few arguments. syntax is command pathtovst childID(optional)\n");
}

TEST_F(Report, Total) {
  printTotal(64);
  EXPECT_EQ(GetCapturedStdout(), "total, 64\n");
  EXPECT_EQ(gStep, 0);
}

TEST_F(Report, StepsAreCountedFromOne) {
  printStep("initialize");
  EXPECT_EQ(gStep, 1);
  printStep("inspect class info");
  EXPECT_EQ(gStep, 2);
  EXPECT_EQ(GetCapturedStdout(), "1, initialize\n2, inspect class info\n");
}

TEST_F(Report, StepsGoOnFromWhereTheCounterStands) {
  gStep = 64;
  printStep("inspect latency");
  EXPECT_EQ(GetCapturedStdout(), "65, inspect latency\n");
}

TEST_F(Report, AFailureWithACode) {
  gCurTest = "delete, create and initialize";
  printFailure(-1);
  printFailure(2147483647);
  EXPECT_EQ(GetCapturedStdout(),
            "!delete, create and initialize failed -1\n"
            "!delete, create and initialize failed 2147483647\n");
}

TEST_F(Report, AFailureWithoutACode) {
  gCurTest = "gather info";
  printFailure();
  EXPECT_EQ(GetCapturedStdout(), "!gather info failed, unknown error\n");
}

TEST_F(Report, AFailureBeforeTheFirstPhaseHasNoName) {
  printFailure(-1);
  printFailure();
  EXPECT_EQ(GetCapturedStdout(), "! failed -1\n! failed, unknown error\n");
}

TEST_F(Report, PercentSignsAreTextLikeAnyOther) {
  gCurTest = "100%s %d%n";
  printFailure(5);
  printFailure();
  printStep("50%s");
  EXPECT_EQ(GetCapturedStdout(), "!100%s %d%n failed 5\n!100%s %d%n failed, unknown error\n1, 50%s\n");
}

TEST_F(Report, TheLastWordsHaveNoLineEndAndAreSaidOnce) {
  printUnexpectedExit();
  printUnexpectedExitDirectly();
  EXPECT_EQ(GetCapturedStdout(), "unexpected exit");
}

TEST_F(Report, TheLastWordsAreNotRepeatedOnTheOrdinaryWay) {
  printUnexpectedExitDirectly();
  printUnexpectedExit();
  EXPECT_EQ(GetCapturedStdout(), "unexpected exit");
}

TEST_F(Report, TheLastWordsOfManyThreadsAreSaidOnce) {
  std::vector<std::thread> threads;
  for (int i = 0; i < 8; ++i)
    threads.emplace_back(i % 2 == 0 ? printUnexpectedExit : printUnexpectedExitDirectly);
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(GetCapturedStdout(), "unexpected exit");
}

// Standard output as a pipe, as a host sees it, from which only what was flushed can be read.
class FlushedReport : public testing::Test {
 protected:
  void SetUp() override {
    gStep = 0;
    gCurTest = "gather info";
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

TEST_F(FlushedReport, EveryLineIsOnItsWayAtOnce) {
  printTotal(51);
  EXPECT_EQ(received(), "total, 51\n");
  printStep("initialize");
  EXPECT_EQ(received(), "1, initialize\n");
  printFailure(5);
  EXPECT_EQ(received(), "!gather info failed 5\n");
  printFailure();
  EXPECT_EQ(received(), "!gather info failed, unknown error\n");
  printUnexpectedExit();
  EXPECT_EQ(received(), "unexpected exit");
}

}  // namespace
