// SPDX-License-Identifier: MIT
// The table of faults, and those of a line or two.
#include "plugins/faulty/faults.h"

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <exception>
#include <iostream>
#include <sstream>
#include <stdexcept>

#include <unistd.h>

#include "plugins/faulty/settings.h"

namespace sample_plugins {

VstInt32 longTextRequest = kNoRequest;
bool yieldsNoInstance = false;
bool answersNullChunk = false;

namespace {

struct Oddity {};

/// The one of several faults that is being committed. Made when first asked for: a fault may come while the
/// module's own objects are still being made.
std::string& kindUnderWay() {
  static std::string kind;
  return kind;
}

/// What follows the colon in the fault's name; empty without one.
std::string faultDetail() {
  const std::size_t colon = kindUnderWay().find(':');
  return colon == std::string::npos ? "" : kindUnderWay().substr(colon + 1);
}

void answerLongTexts() {
  const std::string opcode = faultDetail();
  longTextRequest = opcode.empty() ? kEveryRequest : std::atoi(opcode.c_str());
}

/// Stays in the stream's buffer until somebody flushes it.
void printWithoutNewline() { std::fputs("a text without an end", stdout); }

// Wide output turns a stream wide that has no orientation yet, and a wide stream prints no bytes. On a byte
// stream wprintf prints nothing, while std::wcout still prints its text.

void printWide() { std::wprintf(L"a wide text\n"); }

/// A fault may come while the module is loaded, before the stream of this file is ready.
void printToWideStream() {
  static const std::ios_base::Init streams;
  std::wcout << L"a text without an end" << std::flush;
}

void divideByZero() {
  volatile int number = 0;
  number = 100 / number;  // 1 / number would be done without a division.
}

void raiseSignalNamed(const std::string& name) {
  for (int number = 1; number < NSIG; ++number) {
    const char* abbreviation = sigabbrev_np(number);
    if (abbreviation != nullptr && name == std::string("SIG") + abbreviation) {
      std::raise(number);
      return;
    }
  }
  complain("no such signal: " + name);
}

void raiseSignal() { raiseSignalNamed(faultDetail()); }

void raiseSignalInAtExit() {
  static const std::string name = faultDetail();
  std::atexit([] { raiseSignalNamed(name); });
}

void hang() {
  for (;;) pause();
}

void spin() {
  for (volatile unsigned turns = 0;; turns = turns + 1) {
  }
}

struct Fault {
  const char* kind;
  void (*commit)();
};

constexpr Fault kFaults[] = {
    {"null_store", storeToAddressZero},
    {"write_read_only", writeToReadOnlyMemory},
    {"stack_overflow", overflowTheStack},
    {"abort", [] { std::abort(); }},
    {"terminate", [] { std::terminate(); }},
    {"throw_int", [] { throw 5; }},
    {"throw_runtime_error", [] { throw std::runtime_error("a fault on purpose"); }},
    {"throw_struct", [] { throw Oddity(); }},
    {"exit", [] { std::exit(exitStatus()); }},
    {"_exit", [] { _exit(exitStatus()); }},
    {"quick_exit", [] { std::quick_exit(exitStatus()); }},
    {"raise", raiseSignal},
    {"raise_in_atexit", raiseSignalInAtExit},
    {"divide_by_zero", divideByZero},
    {"illegal_instruction", [] { __builtin_trap(); }},
    {"double_free", freeTwice},
    {"heap_corruption", writeBehindABlock},
    {"crash_with_heap_lock", crashWithHeapLock},
    {"crash_with_stdout_lock", crashWithStdoutLock},
    {"crash_with_own_stdout_lock", crashWithOwnStdoutLock},
    {"crash_under_destructor_lock", crashUnderDestructorLock},
    {"thread_crash", crashOnAThread},
    {"thread_throw", throwOnAThread},
    {"thread_stack_overflow", overflowTheStackOfAThread},
    {"thread_crash_behind_the_run", crashOnAThreadBehindTheRun},
    {"exit_on_a_thread", exitOnAThread},
    {"leave_the_thread", leaveTheThread},
    {"crash_in_atexit", crashInAtExit},
    {"crash_in_every_atexit", crashInEveryAtExit},
    {"crash_in_static_destructor", crashInStaticDestructor},
    {"hang_in_atexit", hangInAtExit},
    {"use_heap_in_atexit", useHeapInAtExit},
    {"throw_when_unloaded", throwWhenUnloaded},
    {"print_when_unloaded", printWhenUnloaded},
    {"replace_handlers_then_crash", replaceHandlersThenCrash},
    {"block_signals_then_crash", blockSignalsThenCrash},
    {"block_signals", blockSignalsButCrashes},
    {"print", printWithoutNewline},
    {"wprintf", printWide},
    {"wcout", printToWideStream},
    {"buffer_stdout", bufferStdout},
    {"close_stdout", closeStdout},
    {"close_stderr", [] { close(STDERR_FILENO); }},
    {"hold_stdout_lock", holdStdoutLock},
    {"flood_stdout", floodStdout},
    {"long_texts", answerLongTexts},
    {"no_instance", [] { yieldsNoInstance = true; }},
    {"null_chunk", [] { answersNullChunk = true; }},
    {"fork_keeping_stdout", forkKeepingStdout},
    {"daemon_keeping_stdout", daemonKeepingStdout},
    {"daemon_flooding_stdout", daemonFloodingStdout},
    {"fork_child_goes_on", forkChildThatGoesOn},
    {"fork_child_exits", forkChildThatExits},
    {"fork_child_crashes", forkChildThatCrashes},
    {"vfork_child_crashes", vforkChildThatCrashes},
    {"exec", becomeAnotherProgram},
    {"forge_lines", forgeLines},
    {"forge_lines_in_a_child", forgeLinesInAChild},
    {"forge_step", forgeStep},
    {"forge_failure", forgeFailure},
    {"forge_last_words", forgeLastWords},
    {"scribble_over_the_record", scribbleOverTheRecord},
    {"wipe_the_record", wipeTheRecord},
    {"change_locale_and_directory", changeLocaleAndDirectory},
    {"trap_floating_point", trapFloatingPoint},
    {"hang", hang},
    {"spin", spin},
};

/// Takes "@load" off the end of a kind; false for a kind without it.
bool takeLoadSuffix(std::string& kind) {
  const std::string suffix = "@load";
  if (kind.size() < suffix.size() || kind.compare(kind.size() - suffix.size(), suffix.size(), suffix) != 0) {
    return false;
  }
  kind.erase(kind.size() - suffix.size());
  return true;
}

void commitOneFault() {
  const std::string name = kindUnderWay().substr(0, kindUnderWay().find(':'));
  for (const Fault& fault : kFaults) {
    if (name == fault.kind) {
      fault.commit();
      return;
    }
  }
  complain("no such fault: " + kindUnderWay());
}

}  // namespace

void commitFaults(bool whileLoading) {
  const std::string& kinds = faultSettings().kind;
  if (kinds.empty()) complain("there is a place for a fault, and no kind of fault");
  std::istringstream stream(kinds);
  while (std::getline(stream, kindUnderWay(), '+')) {
    if (takeLoadSuffix(kindUnderWay()) == whileLoading) commitOneFault();
  }
}

void complain(const std::string& problem) {
  std::fprintf(stderr, "faulty: %s\n", problem.c_str());
  _exit(125);
}

int exitStatus() { return faultSettings().status; }

void storeToAddressZero() {
  // Both are volatile, the pointer and what it points to: with either one alone, g++ removes the store.
  volatile int* volatile nowhere = nullptr;
  *nowhere = 0;
}

}  // namespace sample_plugins
