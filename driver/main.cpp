// SPDX-License-Identifier: MIT
// vsttorture: tries out one VST 2.x plug-in, so that a host need not find out in its own process.
#include <cstdio>
#include <cstdlib>
#include <string>

#include "driver/blacklist.h"
#include "driver/crash_exit.h"
#include "driver/crash_guard.h"
#include "driver/exit_status.h"
#include "driver/last_words.h"
#include "driver/report.h"
#include "driver/torture_run.h"

namespace {

/// The child that the second argument selects. Text that is not a number selects child 0; hasChildID is still
/// true.
VST_loadID childNamed(const char* argument) {
  int id = 0;
  // NOLINTNEXTLINE(cert-err34-c): text that is not a number leaves `id` at 0, as wanted
  static_cast<void>(std::sscanf(argument, "%d", &id));
  return {true, id};
}

}  // namespace

int main(int argc, const char** argv) {
  initialiseUnwinder();
  openReport();
  const CPPAutoReleasePool pool(kExitCrashed);
  if (argc < 2) {
    printUsage();
    return kExitNoPath;
  }
  const std::string path = argv[1];
  const VST_loadID loadID = argc > 2 ? childNamed(argv[2]) : VST_loadID{};

  bool matched = false;
  if (IsBlackListed(path, 0, matched)) return matched ? kExitRefused : kExitRefusedUnmatched;

  std::atexit(atExitFunction);
  bool isShellPlugin = false;
  const bool passed = RunVSTTortureTest(path, loadID, isShellPlugin);
  waitIfReportIsClosed();
  gExpectedEnd = true;
  if (!passed) return kExitFailed;
  return isShellPlugin ? kExitShell : kExitPassed;
}
