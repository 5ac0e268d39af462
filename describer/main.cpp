// SPDX-License-Identifier: MIT
// vsttorture-describe: says what one VST 2.x plug-in is, as JSON.
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>

#include "describer/describe_bundle.h"
#include "describer/private_output.h"
#include "driver/blacklist.h"
#include "driver/crash_exit.h"
#include "driver/crash_guard.h"
#include "driver/last_words.h"
#include "driver/program.h"
#include "driver/report.h"

namespace {

/// What the program ends with besides the statuses of vsttorture.
constexpr int kExitNotWritten = 74;

constexpr char kUsage[] =
    "usage: vsttorture-describe BUNDLE [CHILD_ID]\n"
    "       vsttorture-describe --help | --version\n"
    "Says what a VST 2.x plug-in is, as one JSON object on standard output.\n";

}  // namespace

int main(int argc, const char** argv) {
  initialiseUnwinder();
  if (argc == 2 && std::strcmp(argv[1], "--help") == 0)
    return std::fputs(kUsage, stdout) < 0 ? kExitNotWritten : 0;
  if (argc == 2 && std::strcmp(argv[1], "--version") == 0)
    return std::puts("vsttorture-describe " VSTTORTURE_VERSION) < 0 ? kExitNotWritten : 0;
  PrivateOutput output;
  openReport();
  const CPPAutoReleasePool pool(kExitCrashed);
  if (argc < 2) {
    std::fputs(kUsage, stderr);
    return kExitNoPath;
  }
  const std::string path = argv[1];
  const VST_loadID loadID = argc > 2 ? childNamed(argv[2]) : VST_loadID{};

  bool matched = false;
  if (IsBlackListed(path, 0, matched)) return matched ? kExitRefused : kExitRefusedUnmatched;

  std::atexit(atExitFunction);
  const std::optional<DescribedBundle> described = describeBundle(path, loadID);
  waitIfReportIsClosed();
  gExpectedEnd = true;
  if (!described) return kExitFailed;
  std::signal(SIGPIPE, SIG_IGN);  // A reader that has gone shall be a failed write.
  if (!output.write(described->json)) {
    std::fprintf(stderr, "vsttorture-describe: the description cannot be written: %s\n",
                 std::strerror(errno));
    return kExitNotWritten;
  }
  return described->isShell ? kExitShell : kExitPassed;
}
