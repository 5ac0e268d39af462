// SPDX-License-Identifier: MIT
// vsttorture: tries out one VST 2.x plug-in, so that a host need not find out in its own process.
#include <cstdio>
#include <cstdlib>
#include <string>

#include "driver/blacklist.h"
#include "driver/crash_guard.h"
#include "driver/exit_status.h"
#include "driver/report.h"
#include "driver/torture_test.h"
#include "driver/way_out.h"

namespace {

/// The child that the second argument names. A text that is no number counts as 0, given.
VST_loadID childNamed(const char* argument) {
  int id = 0;
  // NOLINTNEXTLINE(cert-err34-c): whatever does not scan leaves 0, which is what is wanted.
  static_cast<void>(std::sscanf(argument, "%d", &id));
  return {true, id};
}

}  // namespace

int main(int argc, const char** argv) {
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
