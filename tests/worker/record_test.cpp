// SPDX-License-Identifier: MIT
// The record of whole runs. What it says at each place of each fault is tested in tests/fault_matrix.
#include <csignal>

#include <gmock/gmock.h>

#include "tests/shared/sanitizer.h"
#include "tests/worker/worker_run.h"

using testing::Each;
using testing::EndsWith;
using testing::Gt;
using testing::SizeIs;
using testing::StartsWith;

namespace {

TEST(RecordOfAPass, HoldsEveryStepAndTheVerdict) {
  const RecordOnDisk record;
  const std::string plugin = samplePlugin("well_behaved_effect");
  EXPECT_EQ(runWorker({"--record", record.path(), plugin}).end, "exit status 0");
  const FlightReport report = record.report();
  EXPECT_EQ(report.verdict, kFlightPassed);
  EXPECT_EQ(report.phase, kFlightEnded);
  EXPECT_EQ(report.step, 65u);
  EXPECT_THAT(report.stepTimes, SizeIs(65));
  EXPECT_EQ(report.pointerSize, sizeof(void*));
  EXPECT_EQ(report.bundlePath, plugin);
  EXPECT_THAT(report.requestsMade, Gt(1000u));
  EXPECT_EQ(textOf(report.request), "effClose (1)");
  EXPECT_EQ(report.request.state, kFlightReturned);
  EXPECT_EQ(report.fault.signal, 0);
  EXPECT_FALSE(report.unexpectedExit);
}

TEST(RecordOfAPass, HoldsTheLastRequestToTheHost) {
  const RecordOnDisk record;
  runWorker({"--record", record.path(), samplePlugin("well_behaved_effect")});
  // Each of the two instances asks for the version of the interface, and for nothing else.
  EXPECT_EQ(record.report().hostRequest.count, 2u);
  EXPECT_EQ(record.report().hostRequest.opcode, 1);
  EXPECT_EQ(record.report().hostRequest.thread, record.report().process);
}

TEST(RecordOfARun, OverwritesThatOfTheRunBefore) {
  const RecordOnDisk record;
  runWorker({"--record", record.path(), samplePlugin("open_crashes")});
  EXPECT_EQ(record.report().fault.signal, SIGSEGV);
  runWorker({"--record", record.path(), samplePlugin("shell")});
  EXPECT_EQ(record.report().fault.signal, 0);
  EXPECT_EQ(record.report().fault.modulePath, "");
}

TEST(RecordOfAKilledRun, IsTrue) {
  const RecordOnDisk record;
  ProgramCall call;
  call.arguments = {"--record", record.path(), samplePlugin("faulty")};
  call.environment = {{"FAULT_KIND", "hang"}, {"FAULT_PLACE", "dispatch:44"}};
  call.interruption.signals = {SIGKILL};
  call.interruption.afterText = "5, testing setting states\n";
  call.interruption.afterSeconds = 0.5;
  EXPECT_EQ(runWorker(call).end, "signal 9");
  EXPECT_EQ(sentenceOf(record.report()),
            "step 5, testing setting states: effSetBypass (44) value 1 under way");
}

TEST(RecordOfAnEndedRun, NamesWhoSentTheSignal) {
  const RecordOnDisk record;
  ProgramCall call;
  call.arguments = {"--record", record.path(), samplePlugin("faulty")};
  call.environment = {{"FAULT_KIND", "hang"}, {"FAULT_PLACE", "dispatch:52"}};
  call.interruption.signals = {SIGTERM};
  call.interruption.afterText = "6, inspect latency\n";
  call.interruption.afterSeconds = 0.5;
  EXPECT_EQ(runWorker(call).end, "exit status 7");
  EXPECT_EQ(record.report().fault.signal, SIGTERM);
  EXPECT_NE(record.report().fault.sender, record.report().process);
  EXPECT_NE(record.report().fault.sender, 0u);
}

TEST(Observation, OfARunAddsNoLineAndNoFile) {
  const TemporaryDirectory folder;
  const RecordOnDisk record;
  ProgramCall call;
  call.arguments = {"--record", record.path(), samplePlugin("exits_in_test")};
  call.workingDirectory = folder.path().string();
  const ProgramRun observed = runWorker(call);
  const ProgramRun bare = runVstTorture({samplePlugin("exits_in_test")});
  EXPECT_EQ(observed.standardOutput, bare.standardOutput);
  EXPECT_EQ(observed.standardError, bare.standardError);
  EXPECT_EQ(observed.end, bare.end);
  EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
}

}  // namespace
