// SPDX-License-Identifier: MIT
#include "scanner/scan/json_stream.h"

#include <cerrno>
#include <cstring>
#include <stdexcept>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace scanner {

void JsonStream::openFile(const std::string& file) {
  name = file == "-" ? "standard output" : file;
  if (file.empty()) return;
  if (file == "-") {
    descriptor = STDOUT_FILENO;
    return;
  }
  descriptor = open(file.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_APPEND | O_CLOEXEC, 0666);
  isOwned = true;
  if (descriptor < 0) throw std::runtime_error(file + ": " + std::strerror(errno));
}

JsonStream::~JsonStream() {
  if (isOwned) close(descriptor);
}

void JsonStream::write(const std::string& line) {
  if (!isOpen()) return;
  std::size_t written = 0;
  while (written < line.size()) {
    const ssize_t count = ::write(descriptor, line.data() + written, line.size() - written);
    if (count < 0 && errno == EINTR) continue;
    if (count < 0) {
      trouble = name + ": " + std::strerror(errno);
      isReaderGone = errno == EPIPE;
      // A full disk may have taken the beginning of the line: away with it.
      struct stat status = {};
      if (isOwned && written > 0 && fstat(descriptor, &status) == 0) {
        [[maybe_unused]] const int result =
            ftruncate(descriptor, status.st_size - static_cast<off_t>(written));
      }
      return;
    }
    written += static_cast<std::size_t>(count);
  }
}

}  // namespace scanner
