// SPDX-License-Identifier: MIT
#include "tests/worker/worker_run.h"

#include <fstream>

#include <gtest/gtest.h>

ProgramRun runWorker(const ProgramCall& call) { return runProgram(VSTTORTURE_WORKER, call); }

ProgramRun runWorker(const std::vector<std::string>& arguments) {
  ProgramCall call;
  call.arguments = arguments;
  return runWorker(call);
}

std::string RecordOnDisk::bytes() const {
  std::ifstream file(path(), std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

FlightReport RecordOnDisk::report() const {
  const std::string content = bytes();
  FlightReport report;
  std::string whyNot;
  EXPECT_TRUE(readFlightRecord(content.data(), content.size(), report, whyNot)) << whyNot;
  return report;
}
