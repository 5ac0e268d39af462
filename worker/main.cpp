// SPDX-License-Identifier: MIT
// vsttorture-worker: the run of vsttorture for whoever starts many and wants to know more of each.
//
// The same libraries, lines and statuses, and the same requests to the plug-in. Before them, options: a
// flight record of what is under way, tests of one's own choice, limits of the process.
#include <cstdio>
#include <string>

#include "driver/crash_guard.h"
#include "driver/program.h"
#include "driver/report.h"
#include "flight_recorder/record_file.h"
#include "worker/command_line.h"
#include "worker/limits.h"

namespace {

/// The options cannot be followed. Nothing has been loaded.
constexpr int kExitWrongUse = 64;

int complain(const std::string& mistake) {
  std::fprintf(stderr, "vsttorture-worker: %s\n", mistake.c_str());
  return kExitWrongUse;
}

}  // namespace

int main(int argc, const char** argv) {
  initialiseUnwinder();
  WorkerOptions options;
  std::string mistake;
  if (!readCommandLine(argc, argv, options, mistake)) return complain(mistake);
  if (options.wantsHelp) return std::fputs(kWorkerHelp, stdout) < 0 ? kExitWrongUse : 0;
  if (options.wantsVersion) return std::puts("vsttorture-worker " VSTTORTURE_VERSION) < 0 ? kExitWrongUse : 0;
  if (!options.recordPath.empty() && !keepRecordIn(options.recordPath, mistake)) {
    return complain("cannot keep a record in " + options.recordPath + ": " + mistake);
  }
  if (!limitThisProcess(options, mistake)) return complain(mistake);

  openReport();
  const CPPAutoReleasePool pool(kExitCrashed);
  if (options.firstOperand >= argc) {
    printUsage();
    return kExitNoPath;
  }
  const char* const* operands = argv + options.firstOperand;
  const bool hasChild = options.firstOperand + 1 < argc;
  return tryOutPlugin(operands[0], hasChild ? childNamed(operands[1]) : VST_loadID{},
                      options.tests ? &*options.tests : nullptr);
}
