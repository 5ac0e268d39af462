// SPDX-License-Identifier: MIT
// vsttorture: tries out one VST 2.x plug-in, so that a host need not find out in its own process.
#include "driver/crash_guard.h"
#include "driver/program.h"
#include "driver/report.h"

int main(int argc, const char** argv) {
  initialiseUnwinder();
  openReport();
  const CPPAutoReleasePool pool(kExitCrashed);
  if (argc < 2) {
    printUsage();
    return kExitNoPath;
  }
  return tryOutPlugin(argv[1], argc > 2 ? childNamed(argv[2]) : VST_loadID{});
}
