// SPDX-License-Identifier: MIT
#include "describer/private_output.h"

#include <cerrno>

#include <fcntl.h>
#include <unistd.h>

PrivateOutput::PrivateOutput() : descriptor(fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, STDERR_FILENO + 1)) {
  dup2(STDERR_FILENO, STDOUT_FILENO);
}

PrivateOutput::~PrivateOutput() {
  if (descriptor >= 0) close(descriptor);
}

bool PrivateOutput::write(const std::string& text) {
  std::size_t written = 0;
  while (written < text.size()) {
    const ssize_t count = ::write(descriptor, text.data() + written, text.size() - written);
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) return false;
    written += static_cast<std::size_t>(count);
  }
  return true;
}
