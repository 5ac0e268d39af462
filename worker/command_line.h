// SPDX-License-Identifier: MIT
// The command line of vsttorture-worker.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include <sys/types.h>

/// What the options ask for. Everything behind them, from the bundle on, is as for vsttorture.
struct WorkerOptions {
  bool wantsHelp = false;
  bool wantsVersion = false;
  std::string recordPath = {};                           ///< Empty: no record.
  std::optional<std::vector<int>> tests = std::nullopt;  ///< Each 0 to 5, at least one; none: the full plan.
  std::optional<pid_t> parent = std::nullopt;            ///< To die with; 0: with whoever it is.
  std::optional<std::uint64_t> memoryLimit = std::nullopt;    ///< In bytes.
  std::optional<std::uint64_t> fileSizeLimit = std::nullopt;  ///< In bytes.
  bool withoutCore = false;
  int firstOperand = 1;  ///< Index in argv of the bundle; argc where there is none.
};

/// Reads the options, up to the first argument that is none or that follows "--". False for a mistake, with a
/// sentence about it in `mistake`.
bool readCommandLine(int argc, const char* const* argv, WorkerOptions& options, std::string& mistake);

/// Reads "0,3,3,1", or the same from the file of this name: numbers of tests, 0 to 5, with commas, blanks or
/// line ends between them. A text of digits, commas and blanks is always the list itself. False for a
/// mistake.
bool readTests(const std::string& argument, std::vector<int>& tests, std::string& mistake);

/// What --help prints.
extern const char kWorkerHelp[];
