// SPDX-License-Identifier: MIT
// From what was seen of a run to its verdict. Pure functions.
//
// Lines, end, flight record and limits are judged together. The record tells what the lines cannot: the
// request that was under way, whether a status of 7 was a crash or the plug-in's own, whether the run really
// went to its end. Where they contradict each other the worse wins, and the contradiction is part of the
// result.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "scanner/engine/run_seen.h"
#include "scanner/judge/verdict.h"

namespace scanner {

/// The request of the host that was under way, or that failed.
struct RequestSeen {
  std::string kind;  ///< "load", "entry", "dispatcher", "getParameter", "setParameter"
  std::int32_t opcode = 0;
  std::string name;  ///< Of the opcode, such as "effSetBypass"; "opcode 123" for one without a name.
  std::int32_t index = 0;
  std::int64_t value = 0;
  float opt = 0;
};

/// The last request of the plug-in to its host.
struct HostRequestSeen {
  std::int32_t opcode = 0;
  std::string name;  ///< Of the opcode, such as "audioMasterVersion"; "opcode 123" for one without a name.
  std::int32_t index = 0;
  std::int64_t value = 0;
  std::uint64_t count = 0;  ///< How many there were.
};

/// Where the signal struck.
struct Place {
  std::string module;        ///< File name of the image; empty when unknown.
  std::uint64_t offset = 0;  ///< From where the image is loaded; the program counter itself without a module.
  std::uint64_t address = 0;  ///< What it could not reach, for a memory fault.
};

struct Judgement {
  Verdict verdict = Verdict::kNotRun;
  std::string cause;  ///< In words, for people: one line without the plug-in's own text.
  int step = 0;       ///< The step that was under way; 0 before the first.
  std::string stepText = {};
  std::optional<RequestSeen> request = {};  ///< For failed, crashed, exited, hung, killed.
  std::optional<HostRequestSeen> hostRequest = {};
  std::optional<int> status = {};
  std::optional<int> signal = {};
  std::optional<Place> place = {};
  std::optional<bool> isBusy = {};               ///< For hung: busy or waiting.
  std::vector<std::string> contradictions = {};  ///< Sentences.
  std::vector<double> stepSeconds = {};          ///< How long each step took, as far as the record says.
  std::optional<std::string> testsRun = {};      ///< The random tests, for --tests: "0,3,1".
};

/// The verdict on a run. `listedTests` is how many tests the worker was told to run; 0 for the usual ones.
Judgement judge(const RunSeen& seen, const Limits& limits, std::size_t listedTests = 0);

/// The tests that a run has begun, in order, up to and including this step: the numbers that the worker's --tests
/// takes.
std::vector<int> testsBegun(const RunSeen& seen, int lastStep);

/// "SIGSEGV" for 11; "signal 77" for one without a name.
std::string nameOfSignal(int signal);

}  // namespace scanner
