// SPDX-License-Identifier: MIT
// Runs vsttorture-worker as a child, and reads the record that it leaves.
#pragma once

#include <string>
#include <vector>

#include "flight_recorder/flight_record_reader.h"
#include "tests/shared/program_run.h"
#include "tests/shared/temporary_directory.h"

ProgramRun runWorker(const ProgramCall& call);
ProgramRun runWorker(const std::vector<std::string>& arguments);

/// A file for the record of one run or several, gone with this.
class RecordOnDisk {
 public:
  [[nodiscard]] std::string path() const { return (folder.path() / "record").string(); }
  /// Its bytes; empty where there is no such file.
  [[nodiscard]] std::string bytes() const;
  /// Fails the test where there is no record to read.
  [[nodiscard]] FlightReport report() const;

 private:
  const TemporaryDirectory folder;
};
