// SPDX-License-Identifier: MIT
#include "scanner/judge/judge.h"

#include <algorithm>
#include <csignal>

#include <fmt/format.h>

#include "flight_recorder/flight_record_reader.h"
#include "flight_recorder/opcode_names.h"

namespace scanner {
namespace {

constexpr int kStepsOfAPass = 65;
constexpr int kTotalOfAPlugin = 64;
constexpr int kTotalOfAShell = 51;
constexpr int kStepsOfAShell = 1;
constexpr int kCrashStatus = 7;
constexpr int kFailureStatus = 3;
constexpr int kRefusedStatus = 5;
constexpr int kShellStatus = 1;
constexpr int kPassedStatus = 0;
constexpr int kSignalStatus = 128;  ///< A sandbox reports signal N as this plus N.
constexpr int kHighestSignal = 64;

/// Signals that a fault of the process itself raises. The others are sent: by another process, or by the
/// plug-in.
constexpr int kFaultSignals[] = {SIGSEGV, SIGBUS, SIGILL, SIGFPE, SIGABRT, SIGTRAP, SIGSYS};

constexpr const char* kTestTexts[] = {
    "inspect class info",     "inspect preset info", "inspect parameter info",
    "testing setting states", "inspect latency",     "inspect stream format",
};
/// The random tests begin behind this step,
constexpr int kLastFixedStep = 15;
/// and those of a list behind this one.
constexpr int kStepOfDescription = 1;
/// The second instance is created in this step, and missed in a later one.
constexpr int kStepOfRecreation = 14;
constexpr std::size_t kLongestReason = 1000;
constexpr const char* kLoadFailure = "!create and initialize failed -1";

bool isFaultSignal(int signal) {
  return std::find(std::begin(kFaultSignals), std::end(kFaultSignals), signal) != std::end(kFaultSignals);
}

/// What the lines say.
struct Lines {
  int total = -1;
  int step = 0;
  std::string stepText;
  std::string failure;
  bool hasLastWords = false;
  std::string outOfTurn;  ///< The first line that was not due.

  /// Whether they are those of a run from its beginning to its end.
  [[nodiscard]] bool areWhole(int ofTotal, int ofSteps) const {
    return total == ofTotal && step == ofSteps && failure.empty() && !hasLastWords && outOfTurn.empty();
  }
};

Lines readLines(const RunSeen& seen) {
  Lines lines;
  for (const ProtocolLine& line : seen.lines) {
    switch (line.kind) {
      case ProtocolLine::Kind::kTotal:
        lines.total = line.number;
        break;
      case ProtocolLine::Kind::kStep:
        lines.step = line.number;
        lines.stepText = line.text;
        break;
      case ProtocolLine::Kind::kFailure:
        lines.failure = line.text;
        break;
      case ProtocolLine::Kind::kLastWords:
        lines.hasLastWords = true;
        break;
      case ProtocolLine::Kind::kOutOfTurn:
        if (lines.outOfTurn.empty()) lines.outOfTurn = line.text;
        break;
    }
  }
  return lines;
}

std::string megabytes(std::uint64_t bytes) { return fmt::format("{} MiB", bytes >> 20); }

/// The last line that the loader or the worker said on standard error, for the reason of a failed load; its beginning,
/// if it is very long.
std::string lastErrorLine(const RunSeen& seen) {
  std::string line;
  for (const PluginText& text : seen.texts) {
    if (!text.isStandardError) continue;
    std::string rest = text.bytes;
    while (!rest.empty() && rest.back() == '\n') rest.pop_back();
    const std::size_t newline = rest.rfind('\n');
    if (!rest.empty()) line = newline == std::string::npos ? rest : rest.substr(newline + 1);
  }
  constexpr std::string_view kPrefix = "vsttorture: ";
  return line.substr(line.rfind(kPrefix, 0) == 0 ? kPrefix.size() : 0, kLongestReason);
}

/// Of an opcode: its own, or its number where it has none.
std::string nameOr(const char* name, std::int32_t opcode) {
  return name != nullptr ? name : fmt::format("opcode {}", opcode);
}

RequestSeen requestFrom(const ReportedRequest& reported) {
  RequestSeen request;
  switch (reported.kind) {
    case kFlightLoad:
      request.kind = "load";
      break;
    case kFlightEntry:
      request.kind = "entry";
      break;
    case kFlightGetParameter:
      request.kind = "getParameter";
      break;
    case kFlightSetParameter:
      request.kind = "setParameter";
      break;
    default:
      request.kind = "dispatcher";
      request.name = nameOr(effectOpcodeName(reported.opcode), reported.opcode);
  }
  request.opcode = reported.opcode;
  request.index = reported.index;
  request.value = reported.value;
  request.opt = reported.opt;
  return request;
}

/// The tests of the steps behind the first, up to the last.
std::vector<int> testsBetween(const RunSeen& seen, int first, int last) {
  std::vector<int> tests;
  for (const ProtocolLine& line : seen.lines) {
    if (line.kind != ProtocolLine::Kind::kStep || line.number <= first || line.number > last) continue;
    const auto* const test = std::find(std::begin(kTestTexts), std::end(kTestTexts), line.text);
    if (test != std::end(kTestTexts)) tests.push_back(static_cast<int>(test - std::begin(kTestTexts)));
  }
  return tests;
}

class Judge {
 public:
  Judge(const RunSeen& seen_, const Limits& limits_, int listedTests_)
      : seen(seen_), limits(limits_), listedTests(listedTests_), lines(readLines(seen_)) {
    readRecord();
  }

  Judgement result() {
    out.step = lines.step;
    out.stepText = lines.stepText;
    if (hasRecord) compareStep();
    decide();
    addUnkillable();
    describePlace();
    describeSteps();
    return std::move(out);
  }

 private:
  void readRecord() {
    const bool isUnwritten = seen.record.find_first_not_of('\0') == std::string::npos;
    if (isUnwritten) {
      // The worker writes its record before it does anything else. Its file is as long as a record from the beginning.
      if (seen.end.kind == End::Kind::kNotStarted) return;
      hasBegun = !seen.lines.empty() || seen.record.size() != kFlightRecordSizeInBytes;
      if (hasBegun) {
        contradict("there is no flight record, although the run has begun: the plug-in has removed it");
      }
      return;
    }
    std::string whyNot;
    hasRecord = readFlightRecord(seen.record.data(), seen.record.size(), record, whyNot);
    if (!hasRecord) {
      contradict("the flight record makes no sense (" + whyNot +
                 "): the plug-in has probably written over it");
      return;
    }
    // In a sandbox the process has another number.
    const bool isKnown = seen.process > 0 && !seen.wasSandboxed;
    if (isKnown && record.process != static_cast<std::uint32_t>(seen.process)) {
      contradict(fmt::format("the flight record is that of process {}, and the run was process {}",
                             record.process, seen.process));
      hasRecord = false;
      record = {};
      return;
    }
    hasBegun = record.phase != kFlightNotStarted || record.verdict == kFlightRefused;
    if (!hasBegun && lines.total >= 0) {
      hasBegun = true;
      contradict("the flight record says that the run has not begun, the lines do not");
    }
  }

  void compareStep() {
    const int recorded = static_cast<int>(record.step);
    if (recorded == lines.step) return;
    contradict(fmt::format("the lines end at step {}, the flight record at step {}", lines.step, recorded));
    // Where the run went on without its lines, the step in which they stopped tells more.
    if (isAtItsEnd() && recorded > lines.step) return;
    // Else lines can be forged or get lost; the record is written by the program alone, unless the plug-in
    // scribbles over it.
    out.step = recorded;
    out.stepText = record.stepText;
  }

  void contradict(const std::string& sentence) { out.contradictions.push_back(sentence); }

  [[nodiscard]] bool isAtItsEnd() const { return hasRecord && record.phase == kFlightEnded; }
  /// Whether exit() was called in the middle of the run.
  [[nodiscard]] bool hasExited() const { return hasRecord ? record.unexpectedExit : lines.hasLastWords; }
  [[nodiscard]] bool hasFault() const { return hasRecord && record.fault.signal != 0; }

  [[nodiscard]] std::string where() const {
    if (isAtItsEnd()) return "on its way out, after the run";
    const std::string inStep = fmt::format("step {}, {}", out.step, out.stepText);
    if (hasRecord && record.phase == kFlightClosing) return "in the last closing, after " + inStep;
    if (out.step > 0) return inStep;
    if (hasRecord && record.phase == kFlightLoading) return "while it was loaded";
    if (hasRecord && record.phase == kFlightCreating) return "while it was created";
    return "before the first step";
  }

  void decide() {
    if (seen.end.kind == End::Kind::kNotStarted) {
      say(Verdict::kNotRun, "could not be started: " + seen.end.reason);
      return;
    }
    if (seen.end.kind == End::Kind::kExited) out.status = seen.end.status;
    if (seen.limitHit == LimitHit::kInterrupted) {
      say(Verdict::kNotRun, "interrupted: " + where());
    } else if (!hasBegun) {
      notBegun();
    } else if (seen.limitHit != LimitHit::kNone) {
      byLimit();
    } else if (hasRecord && record.verdict == kFlightNoInstance) {
      noInstance();
    } else if (hasFault()) {
      afterFault();
    } else if (const int signal = endSignal(); signal > 0) {
      out.status.reset();
      bySignal(signal);
    } else {
      byStatus(seen.end.status);
    }
    addMemory();
  }

  /// The signal that ended the process; 0 where it ended with a status. In a sandbox a signal shows as a
  /// status, which exit() would have left a note of.
  [[nodiscard]] int endSignal() const {
    if (seen.end.kind == End::Kind::kSignalled) return seen.end.signal;
    const int signal = seen.end.status - kSignalStatus;
    const bool isSignal = seen.wasSandboxed && signal > 0 && signal <= kHighestSignal && !hasExited();
    return isSignal ? signal : 0;
  }

  /// The plug-in was not touched yet: nothing of this is its fault.
  void notBegun() {
    std::string what;
    if (seen.limitHit != LimitHit::kNone) {
      what = "hit a limit";
    } else if (const int signal = endSignal(); signal > 0) {
      what = "was ended by " + nameOfSignal(signal);
    } else {
      what = fmt::format("ended with status {}", seen.end.status);
    }
    const std::string reason = lastErrorLine(seen);
    say(Verdict::kNotRun, fmt::format("the worker {} before it loaded the plug-in{}", what,
                                      reason.empty() ? "" : ": " + reason));
  }

  void byLimit() {
    addRequest();
    const std::string request = inRequest();
    const auto killedFor = [&](const char* what, std::uint64_t bytes) {
      say(Verdict::kKilled, fmt::format("{}: {} more than {}{}", where(), what, megabytes(bytes), request));
    };
    switch (seen.limitHit) {
      case LimitHit::kStep:
        hung("took longer than", limits.stepInSeconds);
        break;
      case LimitHit::kRun:
        hung("the run took longer than", limits.runInSeconds);
        break;
      case LimitHit::kMemory:
        killedFor("its memory was", limits.memoryInBytes);
        break;
      case LimitHit::kOutput:
        killedFor("printed", limits.outputInBytes);
        break;
      default:
        killedFor("wrote files of", limits.filesInBytes);
        break;
    }
    // The signal with which the run was asked to end comes through the guard, too.
    if (hasFault() && isFaultSignal(record.fault.signal)) {
      contradict(
          fmt::format("{} had been handled before, {}", nameOfSignal(record.fault.signal), placeText()));
    }
  }

  void hung(const char* what, double seconds) {
    const Activity activity = seen.activity.value_or(Activity{});
    out.isBusy = activity.processorSeconds > 0.5 * activity.wallSeconds;
    std::string doing = "busy";
    if (!*out.isBusy) {
      doing = activity.state == 'T' ? "stopped by a signal" : "waiting";
      if (!activity.systemCall.empty()) doing += " in " + activity.systemCall;
      if (activity.sockets > 0) doing += activity.sockets == 1 ? ", a socket open" : ", sockets open";
    }
    say(Verdict::kHung, fmt::format("{}: {} {} s, {}{}", where(), what, seconds, doing, inRequest()));
  }

  void noInstance() {
    const bool isSecond = record.step > 0;
    std::string cause = isSecond ? where() + ": it yielded no second instance when it was created again"
                                 : "yields no instance";
    const bool hasThrown = record.thrown.kind != kFlightNoRequest &&
                           record.stepOfThrown == (isSecond ? std::uint32_t{kStepOfRecreation} : 0);
    if (hasThrown) {
      out.request = requestFrom(record.thrown);
      cause += ", " + textOf(record.thrown) + " threw an exception";
    } else if (record.request.kind == kFlightEntry) {
      out.request = requestFrom(record.request);
      cause += ", the entry point answered nothing";
    }
    // The worker crashes on purpose then.
    const bool isOwnEnd =
        seen.end.kind == End::Kind::kSignalled || seen.end.status == kCrashStatus || endSignal() > 0;
    if (isOwnEnd) {
      out.status.reset();
    } else {
      contradict(fmt::format("there was no instance, and still the status is {}", seen.end.status));
    }
    say(Verdict::kNoInstance, cause);
  }

  /// The crash guard's handler saw a signal. However the process ended, that is the cause.
  void afterFault() {
    const int signal = record.fault.signal;
    out.signal = signal;
    if (const int other = endSignal(); other > 0) {
      out.status.reset();
      contradict(fmt::format("{} was handled, and then {} ended the process", nameOfSignal(signal),
                             nameOfSignal(other)));
    } else if (seen.end.status == kCrashStatus) {
      out.status.reset();
    } else {
      contradict(
          fmt::format("{} was handled, and still the status is {}", nameOfSignal(signal), seen.end.status));
    }
    addRequest();
    const bool isSent = record.fault.code <= 0;
    const bool isOwn = record.fault.sender == record.process;
    const std::string what = fmt::format("{}: {}{}", where(), nameOfSignal(signal), inRequest());
    if (isSent && !isOwn) {
      say(Verdict::kKilled,
          what + (record.fault.sender == 0 ? ", sent by another process"
                                           : fmt::format(", sent by process {}", record.fault.sender)));
    } else if (!isFaultSignal(signal)) {
      say(Verdict::kKilled, what + ", which the plug-in sent itself");
    } else {
      say(Verdict::kCrashed, what + ", " + placeText());
    }
  }

  [[nodiscard]] std::string placeText() const {
    const std::string place = placeOf(record.fault);
    std::string text = place.empty() ? "at an unknown place" : "in " + place;
    const bool isMemory = record.fault.signal == SIGSEGV || record.fault.signal == SIGBUS;
    if (isMemory && record.fault.code > 0) {
      text += record.fault.address < 4096 ? ", through a null pointer"
                                          : fmt::format(", at address 0x{:x}", record.fault.address);
    }
    return text;
  }

  /// Ended by a signal that no handler of the worker's saw.
  void bySignal(int signal) {
    out.signal = signal;
    addRequest();
    if (signal == SIGXFSZ) {
      say(Verdict::kKilled, fmt::format("{}: wrote a file of more than {}{}", where(),
                                        megabytes(limits.filesInBytes), inRequest()));
      return;
    }
    const bool isFault = isFaultSignal(signal);
    say(isFault ? Verdict::kCrashed : Verdict::kKilled,
        fmt::format("{}: {}{}{}", where(), nameOfSignal(signal), inRequest(),
                    isFault ? ", which reached no handler of the worker's" : ""));
  }

  void byStatus(int status) {
    if (!hasRecord) {
      withoutRecord(status);
      return;
    }
    if (record.unexpectedExit) {
      exited(status);
      return;
    }
    switch (record.verdict) {
      case kFlightPassed:
        endedAs(Verdict::kPassed, status == kPassedStatus, areWholeLines());
        break;
      case kFlightShell:
        endedAs(Verdict::kShell, status == kShellStatus, lines.areWhole(kTotalOfAShell, kStepsOfAShell));
        break;
      case kFlightFailedWithCode:
      case kFlightFailedForUnknown:
        failed(status);
        break;
      case kFlightRefused:
        if (status == kRefusedStatus && seen.lines.empty()) {
          out.status.reset();
          say(Verdict::kRefused, "the name is on the list of bundles that are never loaded");
        } else {
          contradict("the flight record says that the bundle was refused");
          exited(status);
        }
        break;
      default:
        exited(status);
        break;
    }
  }

  /// Whether the lines are those of a plug-in's whole run.
  [[nodiscard]] bool areWholeLines() const {
    if (listedTests == 0) return lines.areWhole(kTotalOfAPlugin, kStepsOfAPass);
    return lines.areWhole(kStepOfDescription + listedTests, kStepOfDescription + listedTests);
  }

  /// The record says that the run went to its end as `verdict`. Lines and status have to say the same.
  void endedAs(Verdict verdict, bool isStatusRight, bool areLinesRight) {
    if (isStatusRight && areLinesRight && isAtItsEnd() && out.contradictions.empty()) {
      say(verdict, "");
      return;
    }
    if (!areLinesRight) contradict("the flight record says that the run went to its end, the lines do not");
    if (!isStatusRight) contradict("the flight record says that the run passed, the status does not");
    exited(seen.end.status);
  }

  /// The worker keeps a record of every run. Without one nothing confirms what lines and status say, which a
  /// plug-in can forge: what looks well is not believed.
  void withoutRecord(int status) {
    if (status == kCrashStatus) {
      out.status.reset();
      say(Verdict::kCrashed, where() + ": ended by the crash guard");
      return;
    }
    if (status == kFailureStatus && !lines.failure.empty() && !lines.hasLastWords) {
      out.status.reset();
      const bool isLoading = lines.failure == kLoadFailure && lines.total < 0;
      if (isLoading) {
        notLoadable();
      } else {
        say(Verdict::kFailed, where() + ": threw an exception");
      }
      return;
    }
    exited(status);
  }

  void notLoadable() {
    const std::string reason = lastErrorLine(seen);
    say(Verdict::kNotLoadable, reason.empty() ? "the system gave no reason" : reason);
  }

  /// The record says that the run stopped at an exception.
  void failed(int status) {
    if (status == kFailureStatus) {
      out.status.reset();
    } else {
      contradict(fmt::format("the run failed, and still the status is {}", status));
    }
    if (lines.failure.empty()) contradict("the flight record says that the run failed, the lines do not");
    if (lines.hasLastWords) contradict("exit() was not called, although the lines say \"unexpected exit\"");
    const bool hasThrown = record.thrown.kind != kFlightNoRequest && record.stepOfThrown == record.step;
    const bool isFromLoader =
        record.verdict == kFlightFailedWithCode && record.failureCode == -1 && lines.total < 0 && !hasThrown;
    if (isFromLoader && lines.failure == kLoadFailure) {
      notLoadable();
      return;
    }
    std::string what = "threw an exception";
    if (hasThrown) {
      out.request = requestFrom(record.thrown);
      what = textOf(record.thrown) + " threw an exception";
    }
    if (record.verdict == kFlightFailedWithCode) what += fmt::format(", the int {}", record.failureCode);
    // The phase is that of the end by now.
    const std::string place = out.step > 0 ? fmt::format("step {}, {}", out.step, out.stepText)
                              : hasThrown && record.thrown.kind == kFlightLoad ? "while it was loaded"
                                                                               : "while it was created";
    say(Verdict::kFailed, fmt::format("{}: {}", place, what));
  }

  /// Ended by itself, and not at the end of the run, or not so that it can be believed.
  void exited(int status) {
    addRequest();
    if (hasRecord && lines.hasLastWords != record.unexpectedExit) {
      contradict(record.unexpectedExit ? "exit() was called, although the lines do not say so"
                                       : "exit() was not called, although the lines say \"unexpected exit\"");
    }
    if (!lines.outOfTurn.empty()) {
      contradict("a line came that was not due, or one in its place: " + lines.outOfTurn);
    }
    const bool isGoodStatus = status == kPassedStatus || status == kShellStatus;
    const bool areWhole = areWholeLines() || lines.areWhole(kTotalOfAShell, kStepsOfAShell);
    if (isGoodStatus && areWhole && !isAtItsEnd()) {
      contradict(hasRecord
                     ? "the lines are those of a whole run, the flight record says that it did not go to "
                       "its end"
                     : "the lines are those of a whole run, and no flight record confirms it");
    }
    const std::string inStep = out.step > 0 ? fmt::format("step {}, {}", out.step, out.stepText)
                                            : std::string("before the first step");
    const bool isMute = isGoodStatus && isAtItsEnd() && record.step > static_cast<std::uint32_t>(lines.step);
    if (isMute) {
      say(Verdict::kExited,
          inStep + ": the lines end here, although the run went on: standard output was closed");
      return;
    }
    const bool looksPassed = isGoodStatus && (isAtItsEnd() || (areWhole && !hasRecord));
    if (looksPassed && !out.contradictions.empty()) {
      say(Verdict::kExited, "looks like a pass, and is none: " + out.contradictions.back());
      return;
    }
    say(Verdict::kExited,
        fmt::format("{}: ended the process with status {}{}", where(), status, inRequest()));
  }

  /// A plug-in that gets no memory throws, crashes or gives up, and does not say why.
  void addMemory() {
    const bool isNear = limits.memoryInBytes > 0 && seen.limitHit == LimitHit::kNone &&
                        seen.peakMemoryInBytes >= limits.memoryInBytes / 10 * 8;
    if (!isNear || rowOf(out.verdict).isGood || out.verdict == Verdict::kNotRun) return;
    out.cause += fmt::format("; it had used {} of the {} of memory that it may",
                             megabytes(seen.peakMemoryInBytes), megabytes(limits.memoryInBytes));
  }

  /// Whatever the verdict: it says nothing against the run itself.
  void addUnkillable() {
    if (seen.leftBehind.unkillable.empty()) return;
    contradict(fmt::format(
        "could not be killed: process {} is still there after SIGKILL, and has been left with the folder {}",
        fmt::join(seen.leftBehind.unkillable, ", "), seen.leftBehind.folder));
  }

  void say(Verdict verdict, const std::string& cause) {
    out.verdict = verdict;
    out.cause = cause;
  }

  void addRequest() {
    if (!hasRecord) return;
    if (record.request.state == kFlightUnderWay) out.request = requestFrom(record.request);
    if (record.hostRequest.count > 0) {
      HostRequestSeen host;
      host.opcode = record.hostRequest.opcode;
      host.index = record.hostRequest.index;
      host.value = record.hostRequest.value;
      host.count = record.hostRequest.count;
      host.name = nameOr(hostOpcodeName(host.opcode), host.opcode);
      out.hostRequest = host;
    }
  }

  /// " in effSetBypass (44) value 1", or nothing.
  [[nodiscard]] std::string inRequest() const {
    if (!out.request || record.request.state != kFlightUnderWay) return "";
    return " in " + textOf(record.request);
  }

  void describePlace() {
    if (!hasRecord || record.fault.signal == 0) return;
    if (out.verdict != Verdict::kCrashed && out.verdict != Verdict::kKilled) return;
    Place place;
    const std::string& path = record.fault.modulePath;
    const std::size_t slash = path.rfind('/');
    place.module = slash == std::string::npos ? path : path.substr(slash + 1);
    place.offset = place.module.empty() ? record.fault.programCounter : record.fault.offset;
    place.address = record.fault.address;
    out.place = place;
  }

  void describeSteps() {
    if (hasRecord && record.firstTimedStep == 1) {
      for (std::size_t i = 0; i < record.stepTimes.size(); ++i) {
        const double begin = static_cast<double>(record.stepTimes[i]);
        // The last step has no end in the record; the run's own is near enough.
        const double end = i + 1 < record.stepTimes.size()
                               ? static_cast<double>(record.stepTimes[i + 1])
                               : static_cast<double>(record.startTime) + seen.wallSeconds * 1e9;
        out.stepSeconds.push_back(std::max(0.0, (end - begin) / 1e9));
      }
    }
    std::string tests;
    for (const int test : testsBetween(seen, listedTests > 0 ? kStepOfDescription : kLastFixedStep,
                                       kStepsOfAPass + listedTests))
      tests += fmt::format("{}{}", tests.empty() ? "" : ",", test);
    if (!tests.empty()) out.testsRun = tests;
  }

  const RunSeen& seen;
  const Limits& limits;
  const int listedTests;  ///< 0 for the usual ones.
  const Lines lines;
  FlightReport record;
  bool hasRecord = false;
  bool hasBegun = true;  ///< Whether the worker came as far as the plug-in, as far as is known.
  Judgement out;
};

}  // namespace

Judgement judge(const RunSeen& seen, const Limits& limits, std::size_t listedTests) {
  return Judge(seen, limits, static_cast<int>(listedTests)).result();
}

std::vector<int> testsBegun(const RunSeen& seen, int lastStep) { return testsBetween(seen, 0, lastStep); }

std::string nameOfSignal(int signal) { return signalName(signal); }

}  // namespace scanner
