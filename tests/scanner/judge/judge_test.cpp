// SPDX-License-Identifier: MIT
#include <csignal>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "scanner/judge/judge.h"
#include "tests/flight_recorder/record_bytes.h"
#include "tests/shared/step_texts.h"

namespace scanner {
namespace {

constexpr std::uint64_t kMiB = 1 << 20;

// ---- A run that was seen ----------------------------------------------------------------------------------

std::string textOfStep(int step) {
  const auto index = static_cast<std::size_t>(step - 1);
  return index < kOrderedTexts.size() ? kOrderedTexts[index] : "inspect latency";
}

/// A run and its record, built by verbs. The numbers are those of docs/FLIGHT_RECORD.md.
class SeenRun {
 public:
  /// In this step effGetTailSize (52) is under way; 0: the entry point, before the first step.
  static SeenRun in(int step) {
    SeenRun run;
    if (step > 0) {
      run.line(ProtocolLine::Kind::kTotal, 64).lines(1, step);
      run.recordStep(step).phase(3).request(3, 52);
    } else {
      run.phase(2).request(2, 0);
    }
    return run;
  }
  /// All lines are there, and the record says so.
  static SeenRun passed() { return in(65).requestReturned().phase(5).verdict(1).exits(0); }
  static SeenRun shell() {
    SeenRun run;
    run.line(ProtocolLine::Kind::kTotal, 51).lines(1, 1);
    return run.recordStep(1).request(3, 1).requestReturned().phase(5).verdict(2).exits(1);
  }
  /// The module is being loaded.
  static SeenRun loading() { return SeenRun().phase(1).request(1, 0); }
  /// The worker has done nothing yet.
  static SeenRun notBegun() {
    SeenRun run;
    run.record = RecordBytes();
    return run;
  }

  SeenRun& exits(int status) {
    seen.end = {End::Kind::kExited, status, 0, ""};
    return *this;
  }
  SeenRun& killedBy(int signal) {
    seen.end = {End::Kind::kSignalled, 0, signal, ""};
    return *this;
  }
  SeenRun& sandboxed() {
    seen.wasSandboxed = true;
    return *this;
  }
  SeenRun& hits(LimitHit limit) {
    seen.limitHit = limit;
    return exits(7);
  }
  SeenRun& doing(Activity activity) {
    seen.activity = activity;
    return *this;
  }
  SeenRun& peak(std::uint64_t bytes) {
    seen.peakMemoryInBytes = bytes;
    return *this;
  }
  SeenRun& process(int number) {
    seen.process = number;
    return *this;
  }

  SeenRun& line(ProtocolLine::Kind kind, int number = 0, const std::string& text = "") {
    seen.lines.push_back({kind, number, text});
    return *this;
  }
  SeenRun& lines(int from, int to) {
    for (int step = from; step <= to; ++step) line(ProtocolLine::Kind::kStep, step, textOfStep(step));
    return *this;
  }
  SeenRun& withoutLinesBehind(std::size_t count) {
    seen.lines.resize(count, {ProtocolLine::Kind::kTotal});
    return *this;
  }
  SeenRun& lastWords() { return line(ProtocolLine::Kind::kLastWords); }
  SeenRun& failureLine(const std::string& text) { return line(ProtocolLine::Kind::kFailure, 0, text); }
  SeenRun& error(const std::string& text) {
    seen.texts.push_back({0, true, text});
    return *this;
  }

  SeenRun& phase(std::uint32_t phase) { return set(24, phase); }
  SeenRun& verdict(std::uint32_t verdict) { return set(28, verdict); }
  SeenRun& failureCode(int code) { return set(28, 3).set(32, static_cast<std::uint32_t>(code)); }
  SeenRun& recordStep(int step) {
    record.set32(36, static_cast<std::uint32_t>(step)).setText(320, textOfStep(step) + std::string(1, '\0'));
    for (int i = 0; i < step; ++i) {
      record.set64(384 + 8 * static_cast<std::size_t>(i), 2000000000u + 1000000u * static_cast<unsigned>(i));
    }
    return *this;
  }
  SeenRun& noteOfExit() { return set(48, 1); }
  SeenRun& request(std::uint32_t kind, std::uint32_t opcode) {
    record.set64(64, 335);
    return set(72, 1).set(76, kind).set(80, opcode).set(84, 0);
  }
  /// With index 5 and value 6.
  SeenRun& hostRequest(std::uint32_t opcode, std::uint64_t count) {
    record.set64(128, count).set64(144, 6);
    return set(136, opcode).set(140, 5);
  }
  SeenRun& arguments(std::uint32_t index, std::uint64_t value, std::uint32_t bitsOfFloat) {
    record.set64(88, value);
    return set(84, index).set(96, bitsOfFloat);
  }
  SeenRun& requestReturned() { return set(72, 2); }
  SeenRun& thrown(std::uint32_t kind, std::uint32_t opcode, std::uint32_t step) {
    return set(72, 3).set(192, 3).set(196, kind).set(200, opcode).set(220, step);
  }
  /// code: above 0 from the system; else sent by a process.
  SeenRun& fault(int signal, int code, std::uint32_t sender, std::uint64_t address = 0) {
    set(224, static_cast<std::uint32_t>(signal)).set(228, static_cast<std::uint32_t>(code));
    set(232, 77).set(236, sender);
    record.set64(240, address).set64(248, 0x7f0000004f2a).set64(256, 0x7f0000000000);
    record.setText(1024, "/lib/vst/effect.so");
    return *this;
  }
  /// A null pointer is read, which the guard sees.
  SeenRun& crashes() { return fault(SIGSEGV, 1, 0).lastWords().exits(7); }
  SeenRun& scribbled() {
    record.bytes.assign(4096, '\xA5');
    return *this;
  }
  SeenRun& wiped() {
    record = RecordBytes();
    return *this;
  }
  SeenRun& withoutRecord() {
    record.bytes.clear();
    return *this;
  }

  [[nodiscard]] RunSeen result() const {
    RunSeen run = seen;
    run.record = record.bytes;
    return run;
  }

 private:
  SeenRun() {
    // Nothing but a beginning: process 77, loaded at 1000 s.
    record.set32(36, 0).set32(72, 0).set32(76, 0).set64(64, 0).set64(40, 1000000000).set64(88, 0);
    for (std::size_t i = 0; i < 5; ++i) record.set64(384 + 8 * i, 0);
    record.setText(320, std::string(64, '\0'));
  }
  SeenRun& set(std::size_t offset, std::uint32_t number) {
    record.set32(offset, number);
    return *this;
  }

  RunSeen seen;
  RecordBytes record = RecordBytes::ofARun();
};

// ---- What is to come of it --------------------------------------------------------------------------------

struct Case {
  const char* name;
  SeenRun run;
  const char* verdict;
  int step;
  std::string request;  ///< "effGetTailSize", "load", "entry"; empty for none.
  std::string cause;    ///< The whole of it.
  std::vector<std::string> contradictions = {};
};

void PrintTo(const Case& one, std::ostream* stream) { *stream << one.name; }

class Judging : public testing::TestWithParam<Case> {};

TEST_P(Judging, GivesVerdictPlaceCauseAndContradictions) {
  Limits limits;
  limits.stepInSeconds = 20;
  limits.runInSeconds = 120;
  limits.memoryInBytes = 1000 * kMiB;
  limits.outputInBytes = 64 * kMiB;
  limits.filesInBytes = 100 * kMiB;

  const Judgement judgement = judge(GetParam().run.result(), limits);

  EXPECT_STREQ(rowOf(judgement.verdict).word, GetParam().verdict);
  EXPECT_EQ(judgement.step, GetParam().step);
  EXPECT_EQ(judgement.stepText, GetParam().step == 0 ? "" : textOfStep(GetParam().step));
  const std::optional<RequestSeen>& request = judgement.request;
  const std::string name = !request ? "" : request->kind == "dispatcher" ? request->name : request->kind;
  EXPECT_EQ(name, GetParam().request);
  EXPECT_EQ(judgement.cause, GetParam().cause);
  EXPECT_EQ(judgement.contradictions, GetParam().contradictions);
}

using Kind = ProtocolLine::Kind;

const char kNotToTheEnd[] = "the flight record says that the run went to its end, the lines do not";
const char kNotConfirmed[] = "the lines are those of a whole run, and no flight record confirms it";
const char kWrittenOver[] =
    "the flight record makes no sense (it does not begin with the record's mark): the plug-in has probably "
    "written "
    "over it";

const Case kEnds[] = {
    {"APass", SeenRun::passed(), "passed", 65, "", ""},
    {"AShell", SeenRun::shell(), "shell", 1, "", ""},
    {"ARefusal", SeenRun::loading().phase(0).verdict(6).exits(5), "refused", 0, "",
     "the name is on the list of bundles that are never loaded"},
    {"ALibraryThatIsMissing",
     SeenRun::loading()
         .requestReturned()
         .phase(5)
         .failureCode(-1)
         .failureLine("!create and initialize failed -1")
         .error("vsttorture: libjack.so.0: cannot open shared object file\n")
         .exits(3),
     "not_loadable", 0, "", "libjack.so.0: cannot open shared object file"},
    {"AFailureInARequest",
     SeenRun::in(6)
         .thrown(3, 52, 6)
         .phase(5)
         .failureCode(5)
         .failureLine("!inspect latency test failed 5")
         .exits(3),
     "failed", 6, "effGetTailSize",
     "step 6, inspect latency: effGetTailSize (52) threw an exception, the int 5"},
    {"AnUnknownExceptionInARequest",
     SeenRun::in(6)
         .thrown(3, 52, 6)
         .phase(5)
         .verdict(4)
         .failureLine("!inspect latency test failed, unknown error")
         .exits(3),
     "failed", 6, "effGetTailSize", "step 6, inspect latency: effGetTailSize (52) threw an exception"},
    {"AnIntOfMinusOneThrownWhileLoading",
     SeenRun::loading()
         .thrown(1, 0, 0)
         .phase(5)
         .failureCode(-1)
         .failureLine("!create and initialize failed -1")
         .exits(3),
     "failed", 0, "load", "while it was loaded: loading the module threw an exception, the int -1"},
    {"AFailureThatNoRequestOfTheStepThrew",
     SeenRun::in(6)
         .thrown(5, 0, 4)
         .phase(5)
         .verdict(4)
         .failureLine("!inspect latency test failed, unknown error")
         .exits(3),
     "failed", 6, "", "step 6, inspect latency: threw an exception"},
    {"ANullPointer", SeenRun::in(6).crashes(), "crashed", 6, "effGetTailSize",
     "step 6, inspect latency: SIGSEGV in effGetTailSize (52), in effect.so+0x4f2a, through a null pointer"},
    {"ABadAddress", SeenRun::in(6).fault(SIGSEGV, 1, 0, 0x123456).lastWords().exits(7), "crashed", 6,
     "effGetTailSize",
     "step 6, inspect latency: SIGSEGV in effGetTailSize (52), in effect.so+0x4f2a, at address 0x123456"},
    {"ASignalOfAFaultThatThePlugInRaises", SeenRun::in(6).fault(SIGSEGV, 0, 77).lastWords().exits(7),
     "crashed", 6, "effGetTailSize",
     "step 6, inspect latency: SIGSEGV in effGetTailSize (52), in effect.so+0x4f2a"},
    {"ACrashWhileLoading", SeenRun::loading().crashes(), "crashed", 0, "load",
     "while it was loaded: SIGSEGV in loading the module, in effect.so+0x4f2a, through a null pointer"},
    {"AKillSignalWhileAValueIsRead", SeenRun::in(6).request(4, 0).killedBy(SIGKILL), "killed", 6,
     "getParameter", "step 6, inspect latency: SIGKILL in getParameter 0"},
    {"AKillSignalWhileAValueIsSet", SeenRun::in(6).request(5, 0).killedBy(SIGKILL), "killed", 6,
     "setParameter", "step 6, inspect latency: SIGKILL in setParameter 0 to 0"},
    {"ACrashInTheLastClosing", SeenRun::in(65).phase(4).request(3, 1).crashes(), "crashed", 65, "effClose",
     "in the last closing, after step 65, inspect latency: SIGSEGV in effClose (1), in effect.so+0x4f2a, "
     "through a null "
     "pointer"},
    {"ACrashOnTheWayOut", SeenRun::passed().fault(SIGABRT, -6, 77).exits(7), "crashed", 65, "",
     "on its way out, after the run: SIGABRT, in effect.so+0x4f2a"},
    {"ACrashOnTheWayOutThatNoHandlerSaw", SeenRun::passed().killedBy(SIGFPE), "crashed", 65, "",
     "on its way out, after the run: SIGFPE, which reached no handler of the worker's"},
    {"ACrashThatNoHandlerSaw", SeenRun::in(6).killedBy(SIGSEGV), "crashed", 6, "effGetTailSize",
     "step 6, inspect latency: SIGSEGV in effGetTailSize (52), which reached no handler of the worker's"},
    {"ATermSignalOfAnotherProcess", SeenRun::in(6).fault(SIGTERM, 0, 4711).lastWords().exits(7), "killed", 6,
     "effGetTailSize", "step 6, inspect latency: SIGTERM in effGetTailSize (52), sent by process 4711"},
    {"ATermSignalFromOutsideOfTheSandbox",
     SeenRun::in(6).sandboxed().fault(SIGTERM, 0, 0).lastWords().exits(7), "killed", 6, "effGetTailSize",
     "step 6, inspect latency: SIGTERM in effGetTailSize (52), sent by another process"},
    {"ATermSignalOfThePlugInsOwn", SeenRun::in(6).fault(SIGTERM, -6, 77).lastWords().exits(7), "killed", 6,
     "effGetTailSize",
     "step 6, inspect latency: SIGTERM in effGetTailSize (52), which the plug-in sent itself"},
    {"ASignalOfAFaultFromAnotherProcess", SeenRun::in(6).fault(SIGSEGV, 0, 4711).lastWords().exits(7),
     "killed", 6, "effGetTailSize",
     "step 6, inspect latency: SIGSEGV in effGetTailSize (52), sent by process 4711"},
    {"AKillSignal", SeenRun::in(6).killedBy(SIGKILL), "killed", 6, "effGetTailSize",
     "step 6, inspect latency: SIGKILL in effGetTailSize (52)"},
    {"AnExit", SeenRun::in(6).noteOfExit().lastWords().exits(9), "exited", 6, "effGetTailSize",
     "step 6, inspect latency: ended the process with status 9 in effGetTailSize (52)"},
    {"AnExitOfStatus0", SeenRun::in(6).noteOfExit().lastWords().exits(0), "exited", 6, "effGetTailSize",
     "step 6, inspect latency: ended the process with status 0 in effGetTailSize (52)"},
    {"AQuickExit", SeenRun::in(6).exits(0), "exited", 6, "effGetTailSize",
     "step 6, inspect latency: ended the process with status 0 in effGetTailSize (52)"},
    {"AQuickExitWithTheStatusOfACrash", SeenRun::in(6).exits(7), "exited", 6, "effGetTailSize",
     "step 6, inspect latency: ended the process with status 7 in effGetTailSize (52)"},
    {"AQuickExitWithTheStatusOfARefusal", SeenRun::loading().exits(5), "exited", 0, "load",
     "while it was loaded: ended the process with status 5 in loading the module"},
    {"AQuickExitWithTheStatusOfAShell", SeenRun::in(1).exits(1), "exited", 1, "effGetTailSize",
     "step 1, test gathering info: ended the process with status 1 in effGetTailSize (52)"},
    {"AQuickExitWithTheStatusOfWrongUse", SeenRun::loading().exits(64), "exited", 0, "load",
     "while it was loaded: ended the process with status 64 in loading the module"},
    {"AQuickExitWithAStatusAbove128", SeenRun::in(6).exits(139), "exited", 6, "effGetTailSize",
     "step 6, inspect latency: ended the process with status 139 in effGetTailSize (52)"},
    {"NoInstance", SeenRun::in(0).requestReturned().verdict(5).crashes(), "no_instance", 0, "entry",
     "yields no instance, the entry point answered nothing"},
    {"NoInstanceSinceTheCreationThrew", SeenRun::in(0).request(3, 0).thrown(3, 0, 0).verdict(5).crashes(),
     "no_instance", 0, "effOpen", "yields no instance, effOpen (0) threw an exception"},
    {"NoInstanceWithoutAnEntryPoint", SeenRun::loading().requestReturned().phase(2).verdict(5).crashes(),
     "no_instance", 0, "", "yields no instance"},
    {"NoSecondInstance", SeenRun::in(16).thrown(2, 0, 14).verdict(5).crashes(), "no_instance", 16, "entry",
     "step 16, inspect latency: it yielded no second instance when it was created again, the entry point "
     "threw an "
     "exception"},
    {"NoInstanceAndNoHandlers", SeenRun::in(0).requestReturned().verdict(5).killedBy(SIGSEGV), "no_instance",
     0, "entry", "yields no instance, the entry point answered nothing"},
    {"NotStarted", SeenRun::notBegun(), "not_run", 0, "", "could not be started: "},
};

const Case kSandbox[] = {
    {"AStatusAbove128IsASignal", SeenRun::in(6).sandboxed().exits(128 + SIGSEGV), "crashed", 6,
     "effGetTailSize",
     "step 6, inspect latency: SIGSEGV in effGetTailSize (52), which reached no handler of the worker's"},
    {"AKillSignal", SeenRun::in(6).sandboxed().exits(128 + SIGKILL), "killed", 6, "effGetTailSize",
     "step 6, inspect latency: SIGKILL in effGetTailSize (52)"},
    {"AnExitWithAStatusAbove128", SeenRun::in(6).sandboxed().noteOfExit().lastWords().exits(139), "exited", 6,
     "effGetTailSize", "step 6, inspect latency: ended the process with status 139 in effGetTailSize (52)"},
    {"ForgedLastWordsDoNotHideASignal", SeenRun::in(6).sandboxed().lastWords().exits(128 + SIGKILL), "killed",
     6, "effGetTailSize", "step 6, inspect latency: SIGKILL in effGetTailSize (52)"},
    {"AStatusAboveEverySignal", SeenRun::in(6).sandboxed().exits(193), "exited", 6, "effGetTailSize",
     "step 6, inspect latency: ended the process with status 193 in effGetTailSize (52)"},
    {"TheNumberOfTheProcessIsAnother", SeenRun::passed().sandboxed().process(4711), "passed", 65, "", ""},
    {"TheSandboxItselfFails", SeenRun::notBegun().sandboxed().error("bwrap: Can't mount proc\n").exits(1),
     "not_run", 0, "",
     "the worker ended with status 1 before it loaded the plug-in: bwrap: Can't mount proc"},
    {"TheSandboxIsKilled", SeenRun::notBegun().sandboxed().killedBy(SIGKILL), "not_run", 0, "",
     "the worker was ended by SIGKILL before it loaded the plug-in"},
};

const Case kLimits[] = {
    {"AStepThatIsBusy", SeenRun::in(6).hits(LimitHit::kStep).doing({1.9, 2.0, 'R', "", 0}), "hung", 6,
     "effGetTailSize", "step 6, inspect latency: took longer than 20 s, busy in effGetTailSize (52)"},
    {"AStepThatWaits", SeenRun::in(6).hits(LimitHit::kStep).doing({0.0, 2.0, 'S', "futex", 0}), "hung", 6,
     "effGetTailSize",
     "step 6, inspect latency: took longer than 20 s, waiting in futex in effGetTailSize (52)"},
    {"AStepThatWaitsWithASocket", SeenRun::in(6).hits(LimitHit::kStep).doing({0.0, 2.0, 'S', "poll", 1}),
     "hung", 6, "effGetTailSize",
     "step 6, inspect latency: took longer than 20 s, waiting in poll, a socket open in effGetTailSize (52)"},
    {"AStepThatIsStopped", SeenRun::in(6).hits(LimitHit::kStep).doing({0.0, 2.0, 'T', "", 0}), "hung", 6,
     "effGetTailSize",
     "step 6, inspect latency: took longer than 20 s, stopped by a signal in effGetTailSize (52)"},
    {"ALongRun", SeenRun::in(6).requestReturned().hits(LimitHit::kRun).doing({1.9, 2.0, 'R', "", 0}), "hung",
     6, "", "step 6, inspect latency: the run took longer than 120 s, busy"},
    {"AHangOnTheWayOut", SeenRun::passed().hits(LimitHit::kStep).doing({0.0, 2.0, 'S', "pause", 0}), "hung",
     65, "", "on its way out, after the run: took longer than 20 s, waiting in pause"},
    {"TheSignalThatEndsAHangIsNoContradiction",
     SeenRun::in(6).fault(SIGTERM, 0, 1).lastWords().hits(LimitHit::kStep).doing({0.0, 2.0, 'S', "", 0}),
     "hung", 6, "effGetTailSize",
     "step 6, inspect latency: took longer than 20 s, waiting in effGetTailSize (52)"},
    {"AHangBehindACrash",
     SeenRun::in(6).crashes().hits(LimitHit::kStep).doing({0.0, 2.0, 'S', "", 0}),
     "hung",
     6,
     "effGetTailSize",
     "step 6, inspect latency: took longer than 20 s, waiting in effGetTailSize (52)",
     {"SIGSEGV had been handled before, in effect.so+0x4f2a, through a null pointer"}},
    {"Memory", SeenRun::in(6).hits(LimitHit::kMemory).killedBy(SIGKILL), "killed", 6, "effGetTailSize",
     "step 6, inspect latency: its memory was more than 1000 MiB in effGetTailSize (52)"},
    {"Output", SeenRun::in(6).hits(LimitHit::kOutput).killedBy(SIGKILL), "killed", 6, "effGetTailSize",
     "step 6, inspect latency: printed more than 64 MiB in effGetTailSize (52)"},
    {"Files", SeenRun::in(6).hits(LimitHit::kFiles).killedBy(SIGKILL), "killed", 6, "effGetTailSize",
     "step 6, inspect latency: wrote files of more than 100 MiB in effGetTailSize (52)"},
    {"OneFile", SeenRun::in(6).killedBy(SIGXFSZ), "killed", 6, "effGetTailSize",
     "step 6, inspect latency: wrote a file of more than 100 MiB in effGetTailSize (52)"},
    {"Interrupted", SeenRun::in(6).hits(LimitHit::kInterrupted), "not_run", 6, "",
     "interrupted: step 6, inspect latency"},
    {"AFailureWithLittleMemoryLeft",
     SeenRun::in(6)
         .thrown(3, 52, 6)
         .phase(5)
         .verdict(4)
         .failureLine("!inspect latency test failed, unknown error")
         .peak(900 * kMiB)
         .exits(3),
     "failed", 6, "effGetTailSize",
     "step 6, inspect latency: effGetTailSize (52) threw an exception; it had used 900 MiB of the 1000 MiB "
     "of memory "
     "that it may"},
    {"APassWithLittleMemoryLeft", SeenRun::passed().peak(999 * kMiB), "passed", 65, "", ""},
};

const Case kWorkers[] = {
    {"CannotFollowItsOptions",
     SeenRun::notBegun().error("vsttorture-worker: there is no option --x\n").exits(64), "not_run", 0, "",
     "the worker ended with status 64 before it loaded the plug-in: vsttorture-worker: there is no option "
     "--x"},
    {"IsGivenNoBundle", SeenRun::loading().phase(0).exits(2), "not_run", 0, "",
     "the worker ended with status 2 before it loaded the plug-in"},
    {"SaysVeryMuch", SeenRun::notBegun().error(std::string(5000, 'x') + "\n").exits(127), "not_run", 0, "",
     "the worker ended with status 127 before it loaded the plug-in: " + std::string(1000, 'x')},
    {"CannotBeLinked", SeenRun::notBegun().error("error while loading shared libraries\n").exits(127),
     "not_run", 0, "",
     "the worker ended with status 127 before it loaded the plug-in: error while loading shared libraries"},
    {"DoesNotBeginInTime", SeenRun::notBegun().hits(LimitHit::kStep), "not_run", 0, "",
     "the worker hit a limit before it loaded the plug-in"},
    {"CrashesBeforeItLoadsThePlugIn", SeenRun::loading().phase(0).crashes(), "not_run", 0, "",
     "the worker ended with status 7 before it loaded the plug-in"},
};

const Case kForgeries[] = {
    {"AllLinesAndStatus0",
     SeenRun::in(6).lines(7, 65).exits(0),
     "exited",
     6,
     "effGetTailSize",
     "step 6, inspect latency: ended the process with status 0 in effGetTailSize (52)",
     {"the lines end at step 65, the flight record at step 6",
      "the lines are those of a whole run, the flight record says that it did not go to its end"}},
    {"Status0InTheLastClosing",
     SeenRun::in(65).phase(4).request(3, 1).exits(0),
     "exited",
     65,
     "effClose",
     "in the last closing, after step 65, inspect latency: ended the process with status 0 in effClose (1)",
     {"the lines are those of a whole run, the flight record says that it did not go to its end"}},
    {"Status1OfAShellInTheLastClosing",
     SeenRun::shell().verdict(0).phase(4).exits(1),
     "exited",
     1,
     "",
     "in the last closing, after step 1, test gathering info: ended the process with status 1",
     {"the lines are those of a whole run, the flight record says that it did not go to its end"}},
    {"LinesThatAreMissing",
     SeenRun::passed().withoutLinesBehind(7),
     "exited",
     6,
     "",
     "step 6, inspect latency: the lines end here, although the run went on: standard output was closed",
     {"the lines end at step 6, the flight record at step 65", kNotToTheEnd}},
    {"NoLineAtAll",
     SeenRun::passed().withoutLinesBehind(0),
     "exited",
     0,
     "",
     "before the first step: the lines end here, although the run went on: standard output was closed",
     {"the lines end at step 0, the flight record at step 65", kNotToTheEnd}},
    {"ALineOutOfTurn",
     SeenRun::passed().line(Kind::kOutOfTurn, 0, "7, inspect stream format"),
     "exited",
     65,
     "",
     "looks like a pass, and is none: a line came that was not due, or one in its place: 7, inspect stream "
     "format",
     {kNotToTheEnd, "a line came that was not due, or one in its place: 7, inspect stream format"}},
    {"AFailureLineInARunThatPasses",
     SeenRun::passed().failureLine("!gather info failed 5"),
     "exited",
     65,
     "",
     std::string("looks like a pass, and is none: ") + kNotToTheEnd,
     {kNotToTheEnd}},
    {"LastWordsInARunThatPasses",
     SeenRun::passed().lastWords(),
     "exited",
     65,
     "",
     "looks like a pass, and is none: exit() was not called, although the lines say \"unexpected exit\"",
     {kNotToTheEnd, "exit() was not called, although the lines say \"unexpected exit\""}},
    {"AFailureLineAndStatus3", SeenRun::in(6).failureLine("!inspect latency test failed 5").exits(3),
     "exited", 6, "effGetTailSize",
     "step 6, inspect latency: ended the process with status 3 in effGetTailSize (52)"},
    {"AnotherStatusBehindAPass",
     SeenRun::passed().exits(9),
     "exited",
     65,
     "",
     "on its way out, after the run: ended the process with status 9",
     {"the flight record says that the run passed, the status does not"}},
    {"TheStatusOfAShellBehindAPass",
     SeenRun::passed().exits(1),
     "exited",
     65,
     "",
     "looks like a pass, and is none: the flight record says that the run passed, the status does not",
     {"the flight record says that the run passed, the status does not"}},
    {"Status0BehindAFailure",
     SeenRun::in(6)
         .thrown(3, 52, 6)
         .phase(5)
         .failureCode(5)
         .failureLine("!inspect latency test failed 5")
         .exits(0),
     "failed",
     6,
     "effGetTailSize",
     "step 6, inspect latency: effGetTailSize (52) threw an exception, the int 5",
     {"the run failed, and still the status is 0"}},
    {"AFailureWithoutItsLine",
     SeenRun::in(6).thrown(3, 52, 6).phase(5).failureCode(5).exits(3),
     "failed",
     6,
     "effGetTailSize",
     "step 6, inspect latency: effGetTailSize (52) threw an exception, the int 5",
     {"the flight record says that the run failed, the lines do not"}},
    {"Status0BehindACrash",
     SeenRun::in(6).crashes().exits(0),
     "crashed",
     6,
     "effGetTailSize",
     "step 6, inspect latency: SIGSEGV in effGetTailSize (52), in effect.so+0x4f2a, through a null pointer",
     {"SIGSEGV was handled, and still the status is 0"}},
    {"AllOfAPassButASignalOnTheRecord",
     SeenRun::passed().fault(SIGSEGV, 1, 0),
     "crashed",
     65,
     "",
     "on its way out, after the run: SIGSEGV, in effect.so+0x4f2a, through a null pointer",
     {"SIGSEGV was handled, and still the status is 0"}},
    {"ASignalBehindACrash",
     SeenRun::in(6).crashes().killedBy(SIGKILL),
     "crashed",
     6,
     "effGetTailSize",
     "step 6, inspect latency: SIGSEGV in effGetTailSize (52), in effect.so+0x4f2a, through a null pointer",
     {"SIGSEGV was handled, and then SIGKILL ended the process"}},
    {"Status0WithoutAnInstance",
     SeenRun::in(0).requestReturned().verdict(5).exits(0),
     "no_instance",
     0,
     "entry",
     "yields no instance, the entry point answered nothing",
     {"there was no instance, and still the status is 0"}},
    {"ARefusalBehindALine",
     SeenRun::in(6).verdict(6).exits(5),
     "exited",
     6,
     "effGetTailSize",
     "step 6, inspect latency: ended the process with status 5 in effGetTailSize (52)",
     {"the flight record says that the bundle was refused"}},
    {"ExitOnAThreadOfARunThatGoesOn",
     SeenRun::in(64).lines(65, 65).noteOfExit().lastWords().exits(0),
     "exited",
     64,
     "effGetTailSize",
     "step 64, inspect latency: ended the process with status 0 in effGetTailSize (52)",
     {"the lines end at step 65, the flight record at step 64"}},
    {"AStepThatBeginsWhileTheProcessEnds",
     SeenRun::in(6).recordStep(7).exits(9),
     "exited",
     7,
     "effGetTailSize",
     "step 7, inspect stream format: ended the process with status 9 in effGetTailSize (52)",
     {"the lines end at step 6, the flight record at step 7"}},
};

const Case kRecords[] = {
    {"WrittenOverInARunThatPasses",
     SeenRun::passed().scribbled(),
     "exited",
     65,
     "",
     std::string("looks like a pass, and is none: ") + kNotConfirmed,
     {kWrittenOver, kNotConfirmed}},
    {"WrittenOverInAShell",
     SeenRun::shell().scribbled(),
     "exited",
     1,
     "",
     std::string("looks like a pass, and is none: ") + kNotConfirmed,
     {kWrittenOver, kNotConfirmed}},
    {"WrittenOverInACrash",
     SeenRun::in(6).crashes().scribbled(),
     "crashed",
     6,
     "",
     "step 6, inspect latency: ended by the crash guard",
     {kWrittenOver}},
    {"WrittenOverInAFailure",
     SeenRun::in(6).failureLine("!inspect latency test failed 5").scribbled().exits(3),
     "failed",
     6,
     "",
     "step 6, inspect latency: threw an exception",
     {kWrittenOver}},
    {"WrittenOverWhileLoading",
     SeenRun::loading()
         .failureLine("!create and initialize failed -1")
         .error("no such symbol\n")
         .scribbled()
         .exits(3),
     "not_loadable",
     0,
     "",
     "no such symbol",
     {kWrittenOver}},
    {"WrittenOverWithTheStatusOfARefusal",
     SeenRun::loading().scribbled().exits(5),
     "exited",
     0,
     "",
     "before the first step: ended the process with status 5",
     {kWrittenOver}},
    {"WrittenOverWithTheStatusOfWrongUse",
     SeenRun::loading().scribbled().exits(64),
     "exited",
     0,
     "",
     "before the first step: ended the process with status 64",
     {kWrittenOver}},
    {"SaysThatNothingHasBegun",
     SeenRun::in(6).phase(0).exits(9),
     "exited",
     6,
     "effGetTailSize",
     "step 6, inspect latency: ended the process with status 9 in effGetTailSize (52)",
     {"the flight record says that the run has not begun, the lines do not"}},
    {"WrittenOverInAHang",
     SeenRun::in(6).scribbled().hits(LimitHit::kStep).doing({2.0, 2.0, 'R', "", 0}),
     "hung",
     6,
     "",
     "step 6, inspect latency: took longer than 20 s, busy",
     {kWrittenOver}},
    {"WrittenOverBeforeAKillSignal",
     SeenRun::in(6).scribbled().killedBy(SIGKILL),
     "killed",
     6,
     "",
     "step 6, inspect latency: SIGKILL",
     {kWrittenOver}},
    {"WithOneFieldThatMakesNoSense",
     SeenRun::passed().phase(77),
     "exited",
     65,
     "",
     std::string("looks like a pass, and is none: ") + kNotConfirmed,
     {"the flight record makes no sense (the phase is 77): the plug-in has probably written over it",
      kNotConfirmed}},
    {"Removed",
     SeenRun::passed().withoutRecord(),
     "exited",
     65,
     "",
     std::string("looks like a pass, and is none: ") + kNotConfirmed,
     {"there is no flight record, although the run has begun: the plug-in has removed it", kNotConfirmed}},
    {"RemovedWhileLoading",
     SeenRun::loading().withoutRecord().killedBy(SIGBUS),
     "crashed",
     0,
     "",
     "before the first step: SIGBUS, which reached no handler of the worker's",
     {"there is no flight record, although the run has begun: the plug-in has removed it"}},
    {"Wiped",
     SeenRun::passed().wiped(),
     "exited",
     65,
     "",
     std::string("looks like a pass, and is none: ") + kNotConfirmed,
     {"there is no flight record, although the run has begun: the plug-in has removed it", kNotConfirmed}},
    {"OfAnotherProcess",
     SeenRun::passed().process(78),
     "exited",
     65,
     "",
     std::string("looks like a pass, and is none: ") + kNotConfirmed,
     {"the flight record is that of process 77, and the run was process 78", kNotConfirmed}},
    {"OfThisProcess", SeenRun::passed().process(77), "passed", 65, "", ""},
};

const auto nameOf = [](const auto& one) { return one.param.name; };

INSTANTIATE_TEST_SUITE_P(ARunThatEndsIn, Judging, testing::ValuesIn(kEnds), nameOf);
INSTANTIATE_TEST_SUITE_P(InASandbox, Judging, testing::ValuesIn(kSandbox), nameOf);
INSTANTIATE_TEST_SUITE_P(ALimitOf, Judging, testing::ValuesIn(kLimits), nameOf);
INSTANTIATE_TEST_SUITE_P(AWorkerThat, Judging, testing::ValuesIn(kWorkers), nameOf);
INSTANTIATE_TEST_SUITE_P(AForgery, Judging, testing::ValuesIn(kForgeries), nameOf);
INSTANTIATE_TEST_SUITE_P(ARecord, Judging, testing::ValuesIn(kRecords), nameOf);

// ---- The rest of a judgement ------------------------------------------------------------------------------

TEST(Judge, NamesModuleOffsetAndAddressOfACrash) {
  const Judgement judgement = judge(SeenRun::in(6).fault(SIGSEGV, 1, 0, 0x1234).exits(7).result(), Limits());

  ASSERT_TRUE(judgement.place);
  EXPECT_EQ(judgement.place->module, "effect.so");
  EXPECT_EQ(judgement.place->offset, 0x4f2au);
  EXPECT_EQ(judgement.place->address, 0x1234u);
  EXPECT_EQ(judgement.signal, SIGSEGV);
  EXPECT_EQ(judgement.status, std::nullopt);
}

TEST(Judge, GivesTheRequestWithItsArguments) {
  const SeenRun run = SeenRun::in(6).arguments(7, std::uint64_t{1} << 40, 0x3F000000).killedBy(SIGKILL);
  const std::optional<RequestSeen> request = judge(run.result(), Limits()).request;

  ASSERT_TRUE(request);
  EXPECT_EQ(request->opcode, 52);
  EXPECT_EQ(request->index, 7);
  EXPECT_EQ(request->value, std::int64_t{1} << 40);
  EXPECT_EQ(request->opt, 0.5f);
}

TEST(Judge, NamesTheLastRequestOfThePluginToItsHost) {
  const auto requestAfter = [](SeenRun run) { return judge(run.crashes().result(), Limits()).hostRequest; };

  const std::optional<HostRequestSeen> request = requestAfter(SeenRun::in(6).hostRequest(33, 2));
  ASSERT_TRUE(request);
  EXPECT_EQ(request->name, "audioMasterGetProductString");
  EXPECT_EQ(request->opcode, 33);
  EXPECT_EQ(request->count, 2u);
  EXPECT_EQ(request->index, 5);
  EXPECT_EQ(request->value, 6);
  EXPECT_EQ(requestAfter(SeenRun::in(6).hostRequest(777, 1))->name, "opcode 777");
  EXPECT_FALSE(requestAfter(SeenRun::in(6).hostRequest(0, 0)));
}

TEST(Judge, NamesProcessesThatCouldNotBeKilledAndJudgesTheRunAsWithoutThem) {
  RunSeen passed = SeenRun::passed().result();
  passed.leftBehind.unkillable = {77, 78};
  passed.leftBehind.folder = "/tmp/scratch";
  const Judgement judgement = judge(passed, Limits());

  EXPECT_EQ(judgement.verdict, Verdict::kPassed);
  EXPECT_THAT(
      judgement.contradictions,
      testing::ElementsAre("could not be killed: process 77, 78 is still there after SIGKILL, and has "
                           "been left with the folder /tmp/scratch"));
}

TEST(Judge, GivesTheStatusOfAnExitAndNoSignal) {
  const Judgement judgement = judge(SeenRun::in(6).exits(139).result(), Limits());

  EXPECT_EQ(judgement.status, 139);
  EXPECT_EQ(judgement.signal, std::nullopt);
  EXPECT_FALSE(judgement.place);
}

TEST(Judge, GivesTheSignalOfASandboxAndNoStatus) {
  const Judgement judgement = judge(SeenRun::in(6).sandboxed().exits(137).result(), Limits());

  EXPECT_EQ(judgement.status, std::nullopt);
  EXPECT_EQ(judgement.signal, SIGKILL);
}

TEST(Judge, TellsAHangThatIsBusyFromOneThatWaits) {
  const auto isBusy = [](double processorSeconds) {
    const Activity activity = {processorSeconds, 2.0, 'R', "", 0};
    return judge(SeenRun::in(6).hits(LimitHit::kStep).doing(activity).result(), Limits()).isBusy;
  };

  EXPECT_EQ(isBusy(1.9), true);
  EXPECT_EQ(isBusy(1.1), true);
  EXPECT_EQ(isBusy(0.9), false);
  EXPECT_EQ(judge(SeenRun::passed().result(), Limits()).isBusy, std::nullopt);
}

TEST(Judge, ListsTheTestsThatWereDrawnInTheFormOfTheWorkersOption) {
  SeenRun run = SeenRun::in(15);
  run.line(Kind::kStep, 16, "testing setting states").line(Kind::kStep, 17, "inspect class info");

  EXPECT_EQ(judge(run.result(), Limits()).testsRun, "3,0");
  EXPECT_EQ(judge(SeenRun::in(15).result(), Limits()).testsRun, std::nullopt);
}

TEST(Judge, ARunWithAListOfTestsPassesAtItsOwnLastStep) {
  SeenRun run = SeenRun::in(0);
  run.line(ProtocolLine::Kind::kTotal, 3).lines(1, 3).recordStep(3).request(3, 1);
  run.requestReturned().phase(5).verdict(1).exits(0);

  EXPECT_EQ(judge(run.result(), Limits(), 2).verdict, Verdict::kPassed);
  EXPECT_EQ(judge(run.result(), Limits(), 2).testsRun, "0,1");
  EXPECT_EQ(judge(run.result(), Limits(), 3).verdict, Verdict::kExited);
  EXPECT_EQ(judge(run.result(), Limits()).verdict, Verdict::kExited);
  EXPECT_EQ(judge(SeenRun::passed().result(), Limits(), 64).verdict, Verdict::kExited);
}

TEST(TestsBegun, AreThoseOfTheStepsUpToTheLastInTheFormOfTheWorkersOption) {
  SeenRun run = SeenRun::in(15);
  run.line(Kind::kStep, 16, "testing setting states").line(Kind::kStep, 17, "inspect class info");

  EXPECT_THAT(testsBegun(run.result(), 17), testing::ElementsAre(0, 1, 2, 3, 4, 5, 5, 4, 3, 2, 1, 0, 3, 0));
  EXPECT_THAT(testsBegun(run.result(), 15), testing::SizeIs(12));
  EXPECT_THAT(testsBegun(run.result(), 5), testing::ElementsAre(0, 1, 2, 3));
  EXPECT_THAT(testsBegun(run.result(), 1), testing::IsEmpty());
}

TEST(Judge, TimesEachStepFromTheRecord) {
  const Judgement judgement = judge(SeenRun::in(3).exits(9).result(), Limits());

  ASSERT_EQ(judgement.stepSeconds.size(), 3u);
  EXPECT_DOUBLE_EQ(judgement.stepSeconds[0], 0.001);
  EXPECT_DOUBLE_EQ(judgement.stepSeconds[1], 0.001);
}

TEST(Judge, NamesTheSignalsThatHaveAName) {
  EXPECT_EQ(nameOfSignal(SIGKILL), "SIGKILL");
  EXPECT_EQ(nameOfSignal(SIGXFSZ), "SIGXFSZ");
  EXPECT_EQ(nameOfSignal(33), "signal 33");
}

}  // namespace
}  // namespace scanner
