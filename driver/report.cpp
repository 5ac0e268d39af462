// SPDX-License-Identifier: MIT
#include "driver/report.h"

#include <cstdio>
#include <cwchar>

#include "driver/last_words.h"
#include "flight_recorder/flight_recorder.h"

int gStep = 0;
const char* gCurTest = nullptr;

namespace {

constexpr int kPhaseNameSize = 64;
constexpr int kLineSize = 128;

/// The name of the phase under way, in a buffer of its own; empty before the first phase.
void copyPhaseName(char (&phase)[kPhaseNameSize]) {
  std::snprintf(phase, sizeof phase, "%s", gCurTest == nullptr ? "" : gCurTest);
}

void printLine(const char* line) {
  // Checked under stdout's lock, so that "unexpected exit" cannot appear before this line.
  flockfile(stdout);
  if (!isReportClosed() && isReportingProcess()) {
    std::printf("%s", line);
    std::fflush(stdout);
  }
  funlockfile(stdout);
  waitIfReportIsClosed();
}

}  // namespace

void openReport() {
  std::setvbuf(stdout, nullptr, _IONBF, 0);
  std::fwide(stdout, -1);
  startReporting();
}

void printUsage() { printLine("!too few arguments. syntax is command pathtovst childID(optional)\n"); }

void printTotal(int count) {
  char line[kLineSize];
  std::snprintf(line, sizeof line, "total, %d\n", count);
  printLine(line);
}

void printStep(const char* text) {
  ++gStep;
  noteStep(gStep, text);
  char line[kLineSize];
  std::snprintf(line, sizeof line, "%d, %s\n", gStep, text);
  printLine(line);
}

void printFailure(int code) {
  char phase[kPhaseNameSize];
  copyPhaseName(phase);
  char line[kLineSize];
  std::snprintf(line, sizeof line, "!%s %s %d\n", phase, "failed", code);
  printLine(line);
}

void printFailure() {
  char phase[kPhaseNameSize];
  copyPhaseName(phase);
  char line[kLineSize];
  std::snprintf(line, sizeof line, "!%s %s\n", phase, "failed, unknown error");
  printLine(line);
}
