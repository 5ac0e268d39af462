// SPDX-License-Identifier: MIT
// "unexpected exit" is printed once, whichever function prints it first.
#include <string>
#include <thread>
#include <vector>

#include "driver/last_words.h"
#include "gtest/gtest.h"

namespace {

class UnexpectedExit : public testing::Test {
 protected:
  void SetUp() override {
    startReporting();
    testing::internal::CaptureStdout();
  }
  void TearDown() override {
    EXPECT_EQ(testing::internal::GetCapturedStdout(), "unexpected exit");
    startReporting();
  }
};

TEST_F(UnexpectedExit, IsNotRepeatedDirectly) {
  printUnexpectedExit();
  printUnexpectedExitDirectly();
}

TEST_F(UnexpectedExit, IsNotRepeatedUnderTheLock) {
  printUnexpectedExitDirectly();
  printUnexpectedExit();
}

TEST_F(UnexpectedExit, IsPrintedOnceByManyThreads) {
  std::vector<std::thread> threads;
  for (int i = 0; i < 8; ++i)
    threads.emplace_back(i % 2 == 0 ? printUnexpectedExit : printUnexpectedExitDirectly);
  for (std::thread& thread : threads) thread.join();
}

}  // namespace
