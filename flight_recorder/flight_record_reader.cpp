// SPDX-License-Identifier: MIT
#include "flight_recorder/flight_record_reader.h"

#include <algorithm>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <iterator>

#include "flight_recorder/opcode_names.h"

namespace {

constexpr int kHighestSignal = 64;

struct SignalName {
  int signal;
  const char* name;
};

/// Those that end a process and have a name on every system.
constexpr SignalName kSignalNames[] = {
    {SIGHUP, "SIGHUP"},   {SIGINT, "SIGINT"},       {SIGQUIT, "SIGQUIT"}, {SIGILL, "SIGILL"},
    {SIGTRAP, "SIGTRAP"}, {SIGABRT, "SIGABRT"},     {SIGBUS, "SIGBUS"},   {SIGFPE, "SIGFPE"},
    {SIGKILL, "SIGKILL"}, {SIGUSR1, "SIGUSR1"},     {SIGSEGV, "SIGSEGV"}, {SIGUSR2, "SIGUSR2"},
    {SIGPIPE, "SIGPIPE"}, {SIGALRM, "SIGALRM"},     {SIGTERM, "SIGTERM"}, {SIGXCPU, "SIGXCPU"},
    {SIGXFSZ, "SIGXFSZ"}, {SIGVTALRM, "SIGVTALRM"}, {SIGPROF, "SIGPROF"}, {SIGIO, "SIGIO"},
    {SIGSYS, "SIGSYS"},
};

/// Fills a report from a record and stops at the first field that makes no sense.
class Reading {
 public:
  Reading(const FlightRecord& itsRecord, FlightReport& itsReport, std::string& itsWhyNot)
      : record(itsRecord), report(itsReport), whyNot(itsWhyNot) {}

  bool everything() {
    return header() && progress() && times() && request(record.request, report.request, "the request") &&
           requests() && hostRequest() && thrown() && fault() &&
           text(record.bundlePath, report.bundlePath, "the bundle's path");
  }

 private:
  bool fails(const std::string& reason) {
    whyNot = reason;
    return false;
  }

  /// Takes a number of an enumeration that goes from 0 to `last`.
  template <typename Enumeration>
  bool enumerator(std::uint32_t number, Enumeration last, Enumeration& result, const char* name) {
    if (number > last) return fails(std::string(name) + " is " + std::to_string(number));
    result = static_cast<Enumeration>(number);
    return true;
  }

  template <std::size_t size>
  bool text(const char (&field)[size], std::string& result, const char* name) {
    const char* end = std::find(std::begin(field), std::end(field), '\0');
    if (end == std::end(field)) return fails(std::string(name) + " has no end");
    result.assign(field, end);
    std::replace_if(
        result.begin(), result.end(), [](char c) { return static_cast<unsigned char>(c) < 32 || c == 127; },
        '?');
    return true;
  }

  bool header() {
    if (std::memcmp(record.magic, kFlightRecordMagic, sizeof record.magic) != 0) {
      return fails("it does not begin with the record's mark");
    }
    if (record.version != kFlightRecordVersion) {
      return fails("its version is " + std::to_string(record.version));
    }
    if (record.sizeInBytes != kFlightRecordSizeInBytes) {
      return fails("it gives its size as " + std::to_string(record.sizeInBytes));
    }
    if (record.pointerSize != 4 && record.pointerSize != 8) {
      return fails("its pointers have " + std::to_string(record.pointerSize) + " bytes");
    }
    if (record.process == 0 || record.process > 0x7FFFFFFFu) {
      return fails("the process is " + std::to_string(record.process));
    }
    report.process = record.process;
    report.pointerSize = record.pointerSize;
    return true;
  }

  bool progress() {
    if (!enumerator(record.phase, kFlightEnded, report.phase, "the phase")) return false;
    if (!enumerator(record.verdict, kFlightRefused, report.verdict, "the verdict")) return false;
    if (record.unexpectedExit > 1)
      return fails("the note of an exit is " + std::to_string(record.unexpectedExit));
    if (record.step > 0x7FFFFFFFu) return fails("the step is " + std::to_string(record.step));
    report.failureCode = report.verdict == kFlightFailedWithCode ? record.failureCode : 0;
    report.unexpectedExit = record.unexpectedExit != 0;
    report.step = record.step;
    if (!text(record.stepText, report.stepText, "the step's text")) return false;
    if (report.step == 0) report.stepText.clear();
    return true;
  }

  [[nodiscard]] std::uint64_t timeOf(std::uint32_t step) const {
    return record.stepTimes[(step - 1) % kFlightStepTimes];
  }

  bool times() {
    report.startTime = record.startTime;
    std::uint32_t count = std::min<std::uint32_t>(record.step, kFlightStepTimes);
    // The oldest time has been overwritten already when the process died while it began another step.
    if (count == kFlightStepTimes && timeOf(record.step - count + 1) >= timeOf(record.step)) --count;
    report.firstTimedStep = count == 0 ? 0 : record.step - count + 1;
    std::uint64_t before = record.startTime;
    for (std::uint32_t i = 0; i < count; ++i) {
      const std::uint64_t time = timeOf(report.firstTimedStep + i);
      if (time < before) return fails("the times of the steps go backwards");
      report.stepTimes.push_back(time);
      before = time;
    }
    return true;
  }

  bool request(const FlightRequest& field, ReportedRequest& result, const char* name) {
    const std::string prefix = name;
    if (!enumerator(field.state, kFlightThrew, result.state, (prefix + "'s state").c_str())) return false;
    if (!enumerator(field.kind, kFlightSetParameter, result.kind, (prefix + "'s kind").c_str())) return false;
    const bool isDispatcher = result.kind == kFlightDispatcher;
    const bool isParameter = result.kind == kFlightGetParameter || result.kind == kFlightSetParameter;
    if (isDispatcher) result.opcode = field.opcode;
    if (isDispatcher || isParameter) result.index = field.index;
    if (isDispatcher) result.value = field.value;
    if (isDispatcher || result.kind == kFlightSetParameter) result.opt = field.opt;
    return true;
  }

  /// The first request's kind and number are stored just before its state.
  bool requests() {
    report.requestsMade = record.requestsMade;
    const bool hasState = report.request.state != kFlightIdle;
    if (hasState && (report.requestsMade == 0 || report.request.kind == kFlightNoRequest)) {
      return fails("there is a request, but none was made");
    }
    if (!hasState && report.requestsMade > 1) return fails("requests were made, but there is none");
    return true;
  }

  bool hostRequest() {
    const FlightHostRequest& field = record.hostRequest;
    if (field.count == 0) return true;  // The first may be half stored.
    report.hostRequest = {field.count, field.opcode, field.index, field.value, field.thread};
    return true;
  }

  bool thrown() {
    if (!request(record.thrown, report.thrown, "the request that threw")) return false;
    if (report.thrown.state != kFlightIdle && report.thrown.state != kFlightThrew) {
      return fails("the request that threw has not thrown");
    }
    if (record.thrown.step > record.step) return fails("a request threw in a step that was not reached");
    report.stepOfThrown = record.thrown.step;
    return true;
  }

  bool fault() {
    const FlightFault& field = record.fault;
    if (field.signal < 0 || field.signal > kHighestSignal) {
      return fails("the signal is " + std::to_string(field.signal));
    }
    std::string path;
    if (!text(record.modulePath, path, "the module's path")) return false;
    if (field.signal == 0) return true;
    report.fault.signal = field.signal;
    report.fault.code = field.code;
    report.fault.thread = field.thread;
    report.fault.sender = field.sender;
    report.fault.address = field.address;
    report.fault.programCounter = field.programCounter;
    if (path.empty() || field.moduleAddress == 0) return true;  // Not known, or not yet.
    if (field.moduleAddress > field.programCounter)
      return fails("the module begins behind the program counter");
    report.fault.modulePath = path;
    report.fault.offset = field.programCounter - field.moduleAddress;
    return true;
  }

  const FlightRecord& record;
  FlightReport& report;
  std::string& whyNot;
};

std::string hexadecimal(std::uint64_t number) {
  char text[24];
  std::snprintf(text, sizeof text, "0x%llx", static_cast<unsigned long long>(number));
  return text;
}

std::string shortFloat(float number) {
  char text[32];
  std::snprintf(text, sizeof text, "%g", static_cast<double>(number));
  return text;
}

std::string dispatcherText(const ReportedRequest& request) {
  const char* name = effectOpcodeName(request.opcode);
  std::string text = name == nullptr ? "opcode " + std::to_string(request.opcode)
                                     : std::string(name) + " (" + std::to_string(request.opcode) + ")";
  if (request.index != 0) text += " index " + std::to_string(request.index);
  if (request.value != 0) text += " value " + std::to_string(request.value);
  if (request.opt != 0.0f) text += " float " + shortFloat(request.opt);
  return text;
}

std::string stepOf(const FlightReport& report) {
  if (report.step != 0) return "step " + std::to_string(report.step) + ", " + report.stepText;
  if (report.request.kind == kFlightLoad && report.verdict != kFlightNoInstance) return "loading";
  return report.phase == kFlightNotStarted ? "not started" : "creation";
}

std::string verdictText(const FlightReport& report) {
  switch (report.verdict) {
    case kFlightPassed:
      return "passed";
    case kFlightShell:
      return "passed as a shell";
    case kFlightFailedWithCode:
      return "failed " + std::to_string(report.failureCode);
    case kFlightFailedForUnknown:
      return "failed, unknown error";
    case kFlightNoInstance:
      return "no instance";
    case kFlightRefused:
      return "refused";
    default:
      return {};
  }
}

std::string faultText(const FlightReport& report) {
  const ReportedFault& fault = report.fault;
  std::string text = signalName(fault.signal);
  if (fault.code <= 0) {
    text += fault.sender == report.process ? " raised by itself"
                                           : " sent by process " + std::to_string(fault.sender);
  } else if (fault.signal == SIGSEGV || fault.signal == SIGBUS) {
    text += " at address " + hexadecimal(fault.address);
  }
  if (fault.thread != report.process && fault.thread != 0) text += " on another thread";
  const std::string place = placeOf(fault);
  if (!place.empty()) return text + ", in " + place;
  return fault.programCounter == 0 ? text
                                   : text + ", at " + hexadecimal(fault.programCounter) + " in no module";
}

}  // namespace

bool readFlightRecord(const void* bytes, std::size_t sizeInBytes, FlightReport& report, std::string& whyNot) {
  report = {};
  whyNot.clear();
  if (sizeInBytes != kFlightRecordSizeInBytes) {
    whyNot = "it has " + std::to_string(sizeInBytes) + " bytes instead of 4096";
    return false;
  }
  FlightRecord record;
  std::memcpy(&record, bytes, sizeof record);
  FlightReport read;
  if (!Reading(record, read, whyNot).everything()) return false;
  report = read;
  return true;
}

std::string textOf(const ReportedRequest& request) {
  switch (request.kind) {
    case kFlightLoad:
      return "loading the module";
    case kFlightEntry:
      return "the entry point";
    case kFlightDispatcher:
      return dispatcherText(request);
    case kFlightGetParameter:
      return "getParameter " + std::to_string(request.index);
    case kFlightSetParameter:
      return "setParameter " + std::to_string(request.index) + " to " + shortFloat(request.opt);
    default:
      return "no request";
  }
}

std::string placeOf(const ReportedFault& fault) {
  if (fault.modulePath.empty()) return {};
  return fault.modulePath.substr(fault.modulePath.rfind('/') + 1) + "+" + hexadecimal(fault.offset);
}

std::string signalName(int signal) {
  for (const SignalName& row : kSignalNames) {
    if (row.signal == signal) return row.name;
  }
  return "signal " + std::to_string(signal);
}

std::string sentenceOf(const FlightReport& report) {
  std::string sentence = stepOf(report) + ": ";
  if (report.request.state == kFlightUnderWay) {
    sentence += textOf(report.request) + " under way";
  } else if (report.thrown.state == kFlightThrew && report.stepOfThrown == report.step) {
    sentence += textOf(report.thrown) + " threw an exception";
  } else {
    sentence += "no request under way";
  }
  if (const std::string verdict = verdictText(report); !verdict.empty()) sentence += ", " + verdict;
  if (report.unexpectedExit) sentence += ", exit() was called";
  // Without an instance the program crashes on purpose.
  const bool isMeant = report.verdict == kFlightNoInstance;
  if (report.fault.signal != 0 && !isMeant) sentence += ", " + faultText(report);
  return sentence;
}
