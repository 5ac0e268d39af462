// SPDX-License-Identifier: MIT
#include "driver/program.h"

#include <cstdio>
#include <cstdlib>

#include "driver/blacklist.h"
#include "driver/crash_exit.h"
#include "driver/last_words.h"
#include "driver/torture_run.h"
#include "flight_recorder/flight_recorder.h"

VST_loadID childNamed(const char* argument) {
  int id = 0;
  // NOLINTNEXTLINE(cert-err34-c): text that is not a number leaves `id` at 0, as wanted
  static_cast<void>(std::sscanf(argument, "%d", &id));
  return {true, id};
}

ExitStatus tryOutPlugin(const std::string& path, const VST_loadID& loadID, const std::vector<int>* tests) {
  bool matched = false;
  if (IsBlackListed(path, 0, matched)) {
    noteVerdict(kFlightRefused);
    return matched ? kExitRefused : kExitRefusedUnmatched;
  }

  std::atexit(atExitFunction);
  bool isShellPlugin = false;
  const bool passed = tests == nullptr ? RunVSTTortureTest(path, loadID, isShellPlugin)
                                       : runListedTests(path, loadID, *tests, isShellPlugin);
  waitIfReportIsClosed();
  gExpectedEnd = true;
  if (passed) noteVerdict(isShellPlugin ? kFlightShell : kFlightPassed);
  notePhase(kFlightEnded);
  if (!passed) return kExitFailed;
  return isShellPlugin ? kExitShell : kExitPassed;
}
