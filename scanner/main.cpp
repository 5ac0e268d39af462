// SPDX-License-Identifier: MIT
// vsttorture-scan: tortures many plug-ins, and says which of them fail, where and why.
#include <cstring>
#include <optional>

#include <fcntl.h>
#include <unistd.h>

#include "scanner/scan/history_command.h"
#include "scanner/scan/options.h"
#include "scanner/scan/report_command.h"
#include "scanner/scan/scan.h"

namespace {

/// Gives the numbers 0 to 2 to something where they are closed, so that no file or pipe of ours gets them.
/// Writing to it fails, as it does to a closed descriptor.
void occupyStandardDescriptors() {
  for (int opened = 0; opened >= 0 && opened <= STDERR_FILENO;) {
    opened = open("/dev/null", O_RDONLY);
    if (opened > STDERR_FILENO) close(opened);
  }
}

}  // namespace

int main(int argc, char** argv) {
  occupyStandardDescriptors();
  if (argc > 1 && std::strcmp(argv[1], "history") == 0) return scanner::historyCommand(argc, argv);
  if (argc > 1 && std::strcmp(argv[1], "report") == 0) return scanner::reportCommand(argc - 1, argv + 1);
  int status = scanner::kScanAsWanted;
  const std::optional<scanner::ScanOptions> options = scanner::readOptions(argc, argv, status);
  return options ? scanner::scan(*options) : status;
}
