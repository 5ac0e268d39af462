// SPDX-License-Identifier: MIT
#include "scanner/scan/text_output.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include <sys/ioctl.h>
#include <unistd.h>

namespace scanner {
namespace {

constexpr unsigned kColumnsOfAFile = 100;

}  // namespace

unsigned textColumns(int descriptor) {
  if (isatty(descriptor) == 0) return kColumnsOfAFile;
  winsize size = {};
  return ioctl(descriptor, TIOCGWINSZ, &size) == 0 && size.ws_col > 0 ? size.ws_col
                                                                      : TerminalOptions().columns;
}

TerminalOptions terminalOptions(const ScanOptions& options, int descriptor) {
  TerminalOptions terminal;
  terminal.isTerminal = isatty(descriptor) != 0;
  const char* noColour = std::getenv("NO_COLOR");
  const char* kind = std::getenv("TERM");
  const bool isDumb = kind != nullptr && std::strcmp(kind, "dumb") == 0;
  terminal.hasColours = terminal.isTerminal && !isDumb && (noColour == nullptr || *noColour == '\0');
  terminal.showsProgress = terminal.isTerminal && !isDumb && options.showsProgress;
  terminal.isQuiet = options.isQuiet;
  terminal.columns = textColumns(descriptor);
  return terminal;
}

bool TextOutput::write(const std::string& text) {
  std::size_t written = 0;
  while (!hasFailed && written < text.size()) {
    const ssize_t count = ::write(descriptor, text.data() + written, text.size() - written);
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) {
      hasFailed = true;
      reason = std::strerror(errno);
    } else {
      written += static_cast<std::size_t>(count);
    }
  }
  return !hasFailed;
}

void complain(const std::string& sentence) {
  std::fprintf(stderr, "vsttorture-scan: %s\n", printable(sentence).c_str());
}

}  // namespace scanner
