// SPDX-License-Identifier: MIT
// Reads flight records, and believes nothing: a plug-in may have written anything over them.
//
//   FlightReport report;
//   std::string whyNot;
//   if (readFlightRecord(bytes, size, report, whyNot)) std::puts(sentenceOf(report).c_str());
//
// A record in which any field makes no sense is no record at all: what overwrote one field may have
// overwritten those that still look right. Needs the standard library alone, and stands in a library of its
// own for programs that load no plug-in.
#pragma once

#include <string>
#include <vector>

#include "flight_recorder/flight_record.h"

/// A request of the host's. What its kind does not have is 0.
struct ReportedRequest {
  FlightRequestKind kind = kFlightNoRequest;
  FlightRequestState state = kFlightIdle;
  std::int32_t opcode = 0;
  std::int32_t index = 0;
  std::int64_t value = 0;
  float opt = 0.0f;  ///< Any float, NaN too.
};

struct ReportedHostRequest {
  std::uint64_t count = 0;  ///< 0: the plug-in asked for nothing, and the rest is 0.
  std::int32_t opcode = 0;
  std::int32_t index = 0;
  std::int64_t value = 0;
  std::uint32_t thread = 0;
};

struct ReportedFault {
  int signal = 0;  ///< 0: none, and the rest is 0 or empty.
  std::int32_t code = 0;
  std::uint32_t thread = 0;
  std::uint32_t sender = 0;
  std::uint64_t address = 0;
  std::uint64_t programCounter = 0;
  std::string modulePath;    ///< Empty: not known.
  std::uint64_t offset = 0;  ///< Of the program counter in that module.
};

/// What a record says. Texts hold no control characters; a '?' stands for each.
struct FlightReport {
  std::uint32_t process = 0;
  unsigned pointerSize = 0;  ///< In bytes: 4 or 8.
  FlightPhase phase = kFlightNotStarted;
  FlightVerdict verdict = kFlightNoVerdict;
  std::int32_t failureCode = 0;  ///< With kFlightFailedWithCode.
  bool unexpectedExit = false;
  std::uint32_t step = 0;  ///< 0 before the first.
  std::string stepText;
  std::uint64_t startTime = 0;           ///< CLOCK_MONOTONIC, in nanoseconds.
  std::uint32_t firstTimedStep = 0;      ///< The step of stepTimes[0]; 0 without any.
  std::vector<std::uint64_t> stepTimes;  ///< When each of the last 80 steps at most began.
  std::uint64_t requestsMade = 0;
  ReportedRequest request;
  ReportedHostRequest hostRequest;
  ReportedRequest thrown;
  std::uint32_t stepOfThrown = 0;
  ReportedFault fault;
  std::string bundlePath;
};

/// False for bytes that are no record, with the reason in `whyNot`: "the phase is 77".
bool readFlightRecord(const void* bytes, std::size_t sizeInBytes, FlightReport& report, std::string& whyNot);

/// "effSetBypass (44) value 1", "getParameter 3", "the entry point"; what is 0 is left out.
std::string textOf(const ReportedRequest& request);

/// "lsp-plugins-vst2-1.2.5.so+0x4f2a1"; empty where the module is not known.
std::string placeOf(const ReportedFault& fault);

/// "SIGSEGV"; "signal 33" for one without a name.
std::string signalName(int signal);

/// All of it in one line: "step 5, testing setting states: effSetBypass (44) value 1 under way, SIGSEGV at
/// address 0x0, in lsp-plugins-vst2-1.2.5.so+0xba3480c".
std::string sentenceOf(const FlightReport& report);
